#include "queue_files.h"

#include "failure.h"
#include "paths.h"
#include "queue.h"

#include <fileindex/fileidx.h>

#include <json/reader.h>

#include <ext/stdio_filebuf.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <istream>
#include <limits>
#include <memory>
#include <vector>

namespace fileindexctl {

namespace {

constexpr std::size_t kLongestLine = std::size_t{1} << 20;
constexpr int kDeepest = 256;

using Visitor = std::function<void(const QueueEvent *event)>;

bool IsEvent(const Json::Value &line) {
    return line.isObject() && line.isMember("event") && line["event"].isConvertibleTo(Json::uintValue) &&
           line["path"].isString();
}

std::unique_ptr<Json::CharReader> LineReader() {
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    builder["strictRoot"] = false;
    builder["rejectDupKeys"] = false;
    builder["stackLimit"] = kDeepest;
    return std::unique_ptr<Json::CharReader>(builder.newCharReader());
}

std::optional<QueueEvent> ParseLine(Json::CharReader &reader, const char *begin, const char *end, bool taken) {
    Json::Value line;
    try {
        if (!reader.parse(begin, end, &line, nullptr) || !IsEvent(line)) {
            return std::nullopt;
        }
    } catch (const Json::Exception &) {  // nested too deeply
        return std::nullopt;
    }
    QueueEvent event{line["event"].asUInt(), line["path"].asString(), {}, line["data"], taken};
    if (event.type == kRenameEvent && line["path_old"].isString()) {
        event.oldPath = line["path_old"].asString();
    }
    return event;
}

// Line by line, since a queue may be large; a line beyond the limit is passed over without being kept. Lines that
// begin behind `size` came later; the last one before it is read to its end.
void VisitLines(int descriptor, long long size, bool taken, const Visitor &visitor) {
    __gnu_cxx::stdio_filebuf<char> file(descriptor, std::ios::in);  // closes it
    std::istream lines(&file);
    std::vector<char> buffer(kLongestLine + 1);
    const auto reader = LineReader();
    for (long long position = 0; lines.good() && position < size; position += lines.gcount()) {
        lines.getline(buffer.data(), static_cast<std::streamsize>(buffer.size()));
        const std::streamsize read = lines.gcount();
        if (lines.fail() && !lines.eof() && !lines.bad()) {
            position += read;
            lines.clear();
            lines.ignore(std::numeric_limits<std::streamsize>::max(), '\n');
            visitor(nullptr);
            continue;
        }
        if (read == 0) {
            return;
        }
        const auto event = ParseLine(*reader, buffer.data(), buffer.data() + read - (lines.eof() ? 0 : 1), taken);
        visitor(event ? &*event : nullptr);
    }
}

}  // namespace

std::string QueuePathOf(const std::string &share) {
    std::array<char, 4096> path{};
    if (!IsSharePresent(share) || FILEIDXQueuePathGet(share.c_str(), path.data(), path.size()) < 0) {
        return {};
    }
    return path.data();
}

QueueFiles::File QueueFiles::Open(const std::string &path) {
    File file;
    file.descriptor = Descriptor(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    if (!file.descriptor && (errno == EACCES || errno == EPERM)) {
        throw Failure(ExitStatus::Permission, "no permission for " + path + "; run this as the administrator");
    }
    struct statx status {};
    if (!file.descriptor ||
        statx(file.descriptor.Get(), "", AT_EMPTY_PATH, STATX_BASIC_STATS | STATX_BTIME, &status) != 0 ||
        !S_ISREG(status.stx_mode)) {
        return {};
    }
    file.size = static_cast<long long>(status.stx_size);
    // A queue is made by the first event that goes into it, so its age is that of the oldest event.
    file.birth = (status.stx_mask & STATX_BTIME) != 0 ? status.stx_btime.tv_sec : status.stx_mtime.tv_sec;
    file.identity = std::to_string(status.stx_dev_major) + ":" + std::to_string(status.stx_dev_minor) + ":" +
                    std::to_string(status.stx_ino) + ":" + std::to_string(status.stx_btime.tv_sec) + "." +
                    std::to_string(status.stx_btime.tv_nsec);
    return file;
}

// The daemon takes a queue by renaming it. Opened in this order, a queue that is taken meanwhile cannot be missed,
// only met twice.
QueueFiles::QueueFiles(const std::string &queuePath) : queue_(Open(queuePath)), taken_(Open(queuePath + ".tmp")) {
    struct stat queue {};
    struct stat taken {};
    if (queue_.descriptor && taken_.descriptor && fstat(queue_.descriptor.Get(), &queue) == 0 &&
        fstat(taken_.descriptor.Get(), &taken) == 0 && queue.st_dev == taken.st_dev &&
        queue.st_ino == taken.st_ino) {
        queue_ = {};
    }
}

std::optional<long long> QueueFiles::Oldest() const {
    if (!taken_.birth || !queue_.birth) {
        return taken_.birth ? taken_.birth : queue_.birth;
    }
    return std::min(*taken_.birth, *queue_.birth);
}

void QueueFiles::Visit(const Visitor &visitor) {
    for (const bool taken : {true, false}) {
        File &file = taken ? taken_ : queue_;
        if (file.descriptor) {
            VisitLines(file.descriptor.Release(), file.size, taken, visitor);
        }
    }
}

}  // namespace fileindexctl
