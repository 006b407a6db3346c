#include "queue.h"

#include "paths.h"

#include <fileindex/fileidx.h>
#include <fileindex/paths.h>

#include <json/reader.h>

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <fstream>
#include <functional>
#include <limits>
#include <memory>
#include <vector>

namespace fileindexctl {

namespace {

constexpr std::size_t kLongestLine = std::size_t{1} << 20;
constexpr unsigned kRenameEvent = 256;
constexpr int kDeepest = 256;

struct Event {
    unsigned type;
    std::string path;
    std::string oldPath;
};

using Visitor = std::function<void(const Event *event)>;  // null: a malformed line

std::string QueueOf(const std::string &share) {
    std::array<char, 4096> path{};
    if (!IsSharePresent(share) || FILEIDXQueuePathGet(share.c_str(), path.data(), path.size()) < 0) {
        return {};
    }
    return path.data();
}

std::optional<Event> ParseLine(const char *begin, const char *end) {
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    builder["strictRoot"] = false;
    builder["rejectDupKeys"] = false;
    builder["stackLimit"] = kDeepest;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value line;
    try {
        if (!reader->parse(begin, end, &line, nullptr)) {
            return std::nullopt;
        }
    } catch (const Json::Exception &) {  // nested too deeply
        return std::nullopt;
    }
    if (!line.isObject() || !line.isMember("event") || !line["event"].isConvertibleTo(Json::uintValue) ||
        !line["path"].isString()) {
        return std::nullopt;
    }
    Event event{line["event"].asUInt(), line["path"].asString(), {}};
    if (event.type == kRenameEvent && line["path_old"].isString()) {
        event.oldPath = line["path_old"].asString();
    }
    return event;
}

// Line by line, since a queue may be large; a line beyond the limit is passed over without being kept.
void Visit(const std::string &queue, const Visitor &visitor) {
    if (!VORK::FILEINDEX::IsFileExist(queue)) {
        return;
    }
    std::ifstream file(queue);
    std::vector<char> buffer(kLongestLine + 1);
    while (file.good()) {
        file.getline(buffer.data(), static_cast<std::streamsize>(buffer.size()));
        const std::streamsize read = file.gcount();
        if (file.fail() && !file.eof() && !file.bad()) {
            file.clear();
            file.ignore(std::numeric_limits<std::streamsize>::max(), '\n');
            visitor(nullptr);
            continue;
        }
        if (read == 0) {
            return;
        }
        const char *end = buffer.data() + read - (file.eof() ? 0 : 1);
        const std::optional<Event> event = ParseLine(buffer.data(), end);
        visitor(event ? &*event : nullptr);
    }
}

// A queue file is made by the first event that goes into it, so its age is that of the oldest event.
std::optional<long long> Birth(const std::string &path) {
    struct statx status {};
    if (statx(AT_FDCWD, path.c_str(), AT_SYMLINK_NOFOLLOW, STATX_BTIME | STATX_MTIME, &status) != 0) {
        return std::nullopt;
    }
    return (status.stx_mask & STATX_BTIME) != 0 ? status.stx_btime.tv_sec : status.stx_mtime.tv_sec;
}

}  // namespace

unsigned long Backlog::Total() const {
    unsigned long total = 0;
    for (const auto &[type, count] : events) {
        total += count;
    }
    return total;
}

std::optional<Backlog> ReadBacklog(const std::string &share, const std::string &below) {
    const std::string queue = QueueOf(share);
    if (queue.empty()) {
        return std::nullopt;
    }
    Backlog backlog;
    const Visitor count = [&](const Event *event) {
        if (event == nullptr) {
            ++backlog.malformed;
        } else if (below.empty() || LiesIn(event->path, below) || LiesIn(event->oldPath, below)) {
            ++backlog.events[event->type];
        }
    };
    const std::string temporary = queue + ".tmp";
    backlog.hasTemporary = VORK::FILEINDEX::IsFileExist(temporary);
    for (const auto &file : {temporary, queue}) {
        Visit(file, count);
        const auto birth = Birth(file);
        if (birth && (!backlog.oldest || *birth < *backlog.oldest)) {
            backlog.oldest = birth;
        }
    }
    return backlog;
}

bool IsReindexQueued(const std::string &share, const std::string &fullPath) {
    const std::string queue = QueueOf(share);
    bool found = false;
    const Visitor look = [&](const Event *event) {
        found = found || (event != nullptr && event->type == kReindexEvent && event->path == fullPath);
    };
    Visit(queue, look);
    Visit(queue + ".tmp", look);
    return found;
}

Json::Value BacklogJson(const Backlog &backlog) {
    Json::Value result(Json::objectValue);
    result["total"] = static_cast<Json::UInt64>(backlog.Total());
    result["malformed"] = static_cast<Json::UInt64>(backlog.malformed);
    result["tmp"] = backlog.hasTemporary;
    result["oldest"] = backlog.oldest ? Json::Value(static_cast<Json::Int64>(*backlog.oldest)) : Json::Value();
    result["events"] = Json::Value(Json::objectValue);
    for (const auto &[type, count] : backlog.events) {
        result["events"][std::to_string(type)] = static_cast<Json::UInt64>(count);
    }
    return result;
}

std::string BacklogText(const Backlog &backlog) {
    unsigned long reindex = 0;
    unsigned long settings = 0;
    unsigned long files = 0;
    for (const auto &[type, count] : backlog.events) {
        (type == kReindexEvent ? reindex : type == kSettingsEvent ? settings : files) += count;
    }
    std::string text;
    const auto add = [&](unsigned long count, const char *what) {
        if (count > 0) {
            text += (text.empty() ? "" : ", ") + std::to_string(count) + what;
        }
    };
    add(reindex, " reindex");
    add(settings, " settings");
    add(files, " files");
    add(backlog.malformed, " malformed");
    return text.empty() ? "nothing" : text;
}

}  // namespace fileindexctl
