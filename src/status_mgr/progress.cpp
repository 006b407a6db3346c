#include "folders/coverage.h"
#include "names.h"
#include "no_throw.h"
#include "queue/queue_file.h"
#include "share/location.h"

#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>
#include <fileindex/paths.h>
#include <fileindex/status_mgr.h>

#include <syslog.h>

#include <ctime>
#include <set>
#include <vector>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

constexpr char kFinished[] = "finished";
constexpr char kPaused[] = "paused";
constexpr char kProcessing[] = "processing";
constexpr char kNoSpace[] = "err_no_space";

bool IsPausedAt(long long now, long long resumeTime) {
    return resumeTime == 0 || now < resumeTime;
}

/// The shares that have a folder which may be indexed at present, in name order.
bool IndexableShares(std::set<std::string> &shares) {
    std::vector<Folder> folders;
    if (!IndexMgr::List(folders)) {
        return false;
    }
    for (const Folder &folder : folders) {
        std::string share;
        if (!GetShareNameByPath(share, folder.path)) {
            syslog(LOG_ERR, "%s:%d Failed to get share name from path: %s", kStatusMgrModule, 135,
                   folder.path.c_str());
            return false;
        }
        if (CanPathBeIndexed(folder.path)) {
            shares.insert(share);
        }
    }
    return true;
}

/// Does the queue file hold an event at or under the folder (a share path)?
///
/// A rename counts for its old place too. That place is kept for all later lines until the next rename: the
/// daemon works the lines off in order and may still be moving entries out of it.
bool IsPathInQueue(const std::string &path, const std::string &queueFile) {
    if (!IsFileExist(queueFile)) {
        return false;
    }
    std::string fullPath;
    if (!GetFullPath(fullPath, path)) {
        syslog(LOG_ERR, "%s:%d Cannot get full path: %s", kStatusMgrModule, 30, path.c_str());
        return false;
    }
    bool found = false;
    std::string oldPath;
    const bool opened = ScanQueue(queueFile, [&](std::string_view line, const QueueEvent *event) {
        if (event == nullptr) {
            syslog(LOG_ERR, "%s:%d Malformed command: %s", kStatusMgrModule, 47, std::string(line).c_str());
            return true;
        }
        if (event->type == kRenameEvent) {
            oldPath = event->oldPath;
        }
        found = found || IsAtOrUnder(event->path, fullPath) || IsAtOrUnder(oldPath, fullPath);
        return true;  // to the end, so that every malformed line is recorded
    });
    if (!opened) {
        syslog(LOG_ERR, "%s:%d Failed to open queue=%s, reason=%m", kStatusMgrModule, 37, queueFile.c_str());
    }
    return found;
}

bool ServiceStatus(std::string &status) {
    std::set<std::string> shares;
    if (!IndexableShares(shares)) {
        return false;
    }
    for (const std::string &share : shares) {
        char buffer[kPathSize] = {};
        if (QueuePathOf(share, buffer) < 0) {
            syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", kStatusMgrModule, 146, share.c_str());
            return false;
        }
        const std::string queue = buffer;
        if (!IsFileExist(queue) && !IsFileExist(queue + kQueueTmpSuffix)) {
            continue;
        }
        long long resumeTime = -1;
        if (!StatusMgr::GetPauseInfo(resumeTime)) {
            return false;
        }
        status = IsPausedAt(time(nullptr), resumeTime) ? kPaused : kProcessing;
        return true;
    }
    status = kFinished;  // a pause shows only while there is work
    return true;
}

std::string FolderStatus(const std::string &path) {
    if (!CanPathBeIndexed(path)) {
        return kPaused;  // for the user it is waiting, not broken
    }
    std::string share;
    if (!GetShareNameByPath(share, path)) {
        syslog(LOG_ERR, "%s:%d Failed to get share name from path: %s", kStatusMgrModule, 88, path.c_str());
        return kFinished;
    }
    if (StatusMgr::ShareIsNoSpace(share)) {
        return kNoSpace;
    }
    char buffer[kPathSize] = {};
    if (QueuePathOf(share, buffer) < 0) {
        syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", kStatusMgrModule, 100, share.c_str());
        return kFinished;
    }
    const std::string queue = buffer;
    long long resumeTime = -1;
    (void)StatusMgr::GetPauseInfo(resumeTime);  // unreadable reads as not paused
    if (!IsPathInQueue(path, queue) && !IsPathInQueue(path, queue + kQueueTmpSuffix)) {
        return kFinished;
    }
    return IsPausedAt(time(nullptr), resumeTime) ? kPaused : kProcessing;
}

}  // namespace

bool StatusMgr::GetStatus(std::string &status) {
    return NoThrow([&] { return ServiceStatus(status); });
}

std::string StatusMgr::GetFolderStatus(const std::string &path) {
    return NoThrow([&] { return FolderStatus(path); }, kFinished);
}

}  // namespace FILEINDEX
}  // namespace VORK
