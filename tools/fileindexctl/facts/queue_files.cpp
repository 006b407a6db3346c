#include "facts/queue_files.h"

#include "facts/share_record.h"
#include "report/failure.h"
#include "src/names.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <utility>

namespace VORK::FILEINDEXCTL {

using VORK::FILEINDEX::internal::kMetadataDir;
using VORK::FILEINDEX::internal::kQueueFile;

namespace {

// Without a metadata directory, which the first event makes, nothing waits.
UniqueFd OpenDirectory(const std::string &queuePath) {
    const std::string directory = queuePath.substr(0, queuePath.rfind('/'));
    UniqueFd descriptor(open(directory.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (!descriptor && (errno == EACCES || errno == EPERM)) {
        throw Denied(queuePath);
    }
    struct stat status {};
    if (!descriptor && lstat(directory.c_str(), &status) == 0 && S_ISLNK(status.st_mode)) {
        throw Failure(ExitStatus::kMalformed, directory + " is a symbolic link, through which nothing is read");
    }
    return descriptor;
}

}  // namespace

std::string QueuePathOf(const std::string &share) {
    const SharePointer found = FindShare(share);
    return found ? std::string(found->szPath) + "/" + kMetadataDir + "/" + kQueueFile : std::string();
}

std::string TroubleWithQueue(const std::string &share) {
    const std::string queue = QueuePathOf(share);
    const std::string directory = queue.substr(0, queue.rfind('/'));
    struct stat status {};
    if (!queue.empty() && lstat(directory.c_str(), &status) == 0 && !S_ISDIR(status.st_mode)) {
        return directory + " is a link, or no directory";
    }
    return !queue.empty() && MayNotWrite(queue) ? Denied(queue).what() : "";
}

QueueFiles::File QueueFiles::Open(const UniqueFd &directory, const std::string &path) {
    File file;
    file.descriptor = UniqueFd(openat(directory.Get(), path.c_str() + path.rfind('/') + 1,
                                      O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    if (!file.descriptor && (errno == EACCES || errno == EPERM)) {
        throw Denied(path);
    }
    struct statx status {};
    if (!file.descriptor ||
        statx(file.descriptor.Get(), "", AT_EMPTY_PATH, STATX_BASIC_STATS | STATX_BTIME, &status) != 0 ||
        !S_ISREG(status.stx_mode)) {
        return {};
    }
    file.size = static_cast<off_t>(status.stx_size);
    // A queue is made by the first event that goes into it, so its age is that of the oldest event.
    file.birth = (status.stx_mask & STATX_BTIME) != 0 ? status.stx_btime.tv_sec : status.stx_mtime.tv_sec;
    file.identity = std::to_string(status.stx_dev_major) + ":" + std::to_string(status.stx_dev_minor) + ":" +
                    std::to_string(status.stx_ino) + ":" + std::to_string(status.stx_btime.tv_sec) + "." +
                    std::to_string(status.stx_btime.tv_nsec);
    return file;
}

// The daemon takes a queue by renaming it. Opened in this order, a queue that is taken meanwhile cannot be missed,
// only met twice.
QueueFiles::QueueFiles(const std::string &queuePath) : QueueFiles(OpenDirectory(queuePath), queuePath) {}

QueueFiles::QueueFiles(const UniqueFd &directory, const std::string &queuePath)
    : queue_(Open(directory, queuePath)), taken_(Open(directory, queuePath + ".tmp")) {
    if (queue_.identity == taken_.identity) {
        queue_ = {};
    }
}

bool IsQueueReadable(const std::string &share) {
    try {
        const QueueFiles files(QueuePathOf(share));
        return true;
    } catch (const Failure &) {
        return false;
    }
}

std::optional<long long> QueueFiles::Oldest() const {
    if (!taken_.birth || !queue_.birth) {
        return taken_.birth ? taken_.birth : queue_.birth;
    }
    return std::min(*taken_.birth, *queue_.birth);
}

void QueueFiles::Visit(const std::function<void(const QueueEvent *)> &visitor) {
    for (const bool taken : {true, false}) {
        File &file = taken ? taken_ : queue_;
        atTaken_ = taken;
        line_ = 0;
        if (file.descriptor) {
            QueueLines lines(std::move(file.descriptor), 0, file.size);
            while (lines.Next(current_)) {
                ++line_;
                visitor(reader_.Read(current_));
            }
        }
    }
}

}  // namespace VORK::FILEINDEXCTL
