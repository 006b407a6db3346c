#include "queue/events.h"

#include "base/json/text.h"
#include "base/metadata_entry.h"
#include "base/unique_fd.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"
#include "status/access.h"

#include <fileindex/daemon.h>
#include <fileindex/error.h>
#include <fileindex/fileidx.h>

#include <vork/share.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <functional>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

constexpr int kLockAttempts = 3;
constexpr int kMaxReopens = 16;

bool WantDebugRecords() {
    return LOG_LEVEL == kDebugLevel;
}

/// Asks about one queue file whether a reindex of the event's path is waiting in it.
using PendingCheck = std::function<bool(const std::string &queueFile)>;

/// The daemon takes a queue by renaming it; a line written to the file it has taken might never be read. `opened`
/// is what the descriptor's file is now.
bool StillNames(const MetadataEntry &queue, int fd, struct stat &opened) {
    struct stat named = {};
    if (fstat(fd, &opened) != 0) {
        return false;
    }
    if (!queue.Look(named)) {
        return errno != ENOENT && errno != ENOTDIR;  // what cannot be told must not lose the event
    }
    return named.st_nlink == 1 && named.st_dev == opened.st_dev && named.st_ino == opened.st_ino;
}

/// Has a writer died before it came to the newline of its line? No when that cannot be seen.
bool LacksNewline(const MetadataEntry &queue, const struct stat &opened) {
    if (opened.st_size == 0) {
        return false;
    }
    struct stat status = {};
    const UniqueFd fd = queue.OpenFile(O_RDONLY, status);
    char last = '\n';
    return fd && status.st_dev == opened.st_dev && status.st_ino == opened.st_ino &&
           pread(fd.Get(), &last, 1, opened.st_size - 1) == 1 && last != '\n';
}

/// In one write. What a dying writer left gets its newline first, so as not to take this line with it; what is
/// written short is cut off again, so as not to take the next one.
void WriteLine(const MetadataEntry &queue, int fd, const struct stat &opened, const std::string &line) {
    const std::string text = (LacksNewline(queue, opened) ? "\n" : "") + line;
    const ssize_t written = write(fd, text.data(), text.size());
    if (written == static_cast<ssize_t>(text.size())) {
        return;
    }
    if (written > 0) {
        (void)ftruncate(fd, opened.st_size);  // or else the next writer sees that the newline lacks
    }
    if (WantDebugRecords()) {
        syslog(LOG_ERR, "%s:%d write fail, (%ld, %ld)", records::kEventCut.module, records::kEventCut.line,
               static_cast<long>(written), static_cast<long>(text.size()));
    }
}

/// Appends the line under the queue's own lock. True also when the line was written short, and when the lock
/// stayed busy and the line was dropped: a caller must not be held up. False when the queue cannot be used at all.
bool Append(const std::string &queuePath, const std::string &line) {
    int reopens = 0;
    int lockError = 0;
    for (int attempt = 0; attempt < kLockAttempts;) {
        const MetadataEntry queue(queuePath);
        struct stat opened = {};
        UniqueFd fd = queue.OpenFile(O_WRONLY | O_APPEND | O_CREAT, opened);
        if (!fd) {
            return false;
        }
        if (flock(fd.Get(), LOCK_EX | LOCK_NB) != 0) {
            lockError = errno;
            if (lockError != EINTR && lockError != EAGAIN) {
                if (WantDebugRecords()) {
                    syslog(LOG_ERR, "%s:%d flock fail, path=%s, reason=%m", records::kEventLock.module,
                           records::kEventLock.line, queuePath.c_str());
                }
                return false;
            }
            fd.Close();
            usleep(static_cast<useconds_t>(rand() % 10) * 1000);
            ++attempt;
            continue;
        }
        if (!StillNames(queue, fd.Get(), opened)) {
            if (++reopens > kMaxReopens) {
                return false;
            }
            continue;
        }
        WriteLine(queue, fd.Get(), opened, line);
        flock(fd.Get(), LOCK_UN);
        return true;
    }
    if (WantDebugRecords()) {
        errno = lockError;
        syslog(LOG_ERR, "%s:%d try lock too many times, path=%s, reason=%m", records::kEventDropped.module,
               records::kEventDropped.line, queuePath.c_str());
    }
    return true;
}

/// Sets `share` as soon as it is known; false when the event cannot be queued.
bool QueueEventOf(std::string &share, int type, const std::string &fullPath, const Json::Value &data,
                  const PendingCheck &isReindexQueued) {
    char shareName[kShareNameSize] = {};
    char sharePath[kPathSize] = {};
    if (HasNul(fullPath) ||
        VORKShareNamePathGet(fullPath.c_str(), shareName, sizeof(shareName), sharePath, sizeof(sharePath)) < 0) {
        syslog(LOG_ERR, "%s:%d VORKShareNamePathGet failed, path=%s", records::kEventPath.module,
               records::kEventPath.line, fullPath.c_str());
        return false;
    }
    share = shareName;
    char buffer[kPathSize] = {};
    if (FILEIDXQueuePathGet(shareName, buffer, sizeof(buffer)) < 0) {
        syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", records::kEventQueue.module,
               records::kEventQueue.line, shareName);
        return false;
    }
    const std::string queuePath = buffer;
    // Whatever the new event is: a reindex that is still to come makes it redundant.
    if (isReindexQueued(queuePath) || isReindexQueued(queuePath + kQueueTmpSuffix)) {
        return true;
    }
    if (!CanBeQueued(data)) {
        return false;
    }
    // As ToString writes the object of the three, without a copy of the data.
    std::string line = "{\"data\":" + ToString(data) + ",\"event\":" + std::to_string(type) + ",\"path\":";
    AppendQuoted(line, fullPath);
    return Append(queuePath, line + "}\n");
}

bool QueueOrMark(int type, const std::string &fullPath, const Json::Value &data,
                 const PendingCheck &isReindexQueued) {
    std::string share;
    if (NoThrow([&] { return QueueEventOf(share, type, fullPath, data, isReindexQueued); })) {
        return true;
    }
    // Outside every share the name is empty; the mark is then the only trace of the lost event.
    if (!ChangeStatus([&](Status &status) { return status.ShareSetNeedReindex(share, true); })) {
        syslog(LOG_ERR, "%s:%d ShareSetNeedReindex failed, share=%s", records::kEventMark.module,
               records::kEventMark.line, share.c_str());
    }
    return false;
}

}  // namespace

namespace internal {

bool CanBeQueued(const Json::Value &data) {
    return CanBeWritten(data, 1);
}

bool AddEvent(PendingReindexes &pending, int type, const std::string &fullPath, const std::string &sharePath,
              const Json::Value &data) {
    return QueueOrMark(type, fullPath, data, [&](const std::string &queueFile) {
        return pending.IsQueued(fullPath, sharePath, queueFile);
    });
}

}  // namespace internal

bool AddCustomEvent(const int &type, const std::string &fullPath, const Json::Value &data) {
    return NoThrow([&] {
        return QueueOrMark(type, fullPath, data,
                           [&](const std::string &queueFile) { return IsReindexQueued(fullPath, queueFile); });
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
