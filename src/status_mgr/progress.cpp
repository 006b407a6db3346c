#include "progress/progress.h"

#include "folders/folder_access.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"
#include "status/access.h"

#include <fileindex/folders.h>
#include <fileindex/indexability.h>
#include <fileindex/paths.h>
#include <fileindex/status_mgr.h>

#include <syslog.h>

#include <set>
#include <string>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

/// The shares that have a folder which may be indexed at present, in name order.
bool IndexableShares(std::set<std::string> &shares) {
    Folders store;
    if (!FolderAccess::Load(store)) {
        return false;
    }
    for (const auto &[path, folder] : FolderAccess::All(store)) {
        std::string share;
        if (!GetShareNameByPath(share, folder.path)) {
            syslog(LOG_ERR, "%s:%d Failed to get share name from path: %s", records::kStatusShare.module,
                   records::kStatusShare.line, folder.path.c_str());
            return false;
        }
        if (CanPathBeIndexed(folder.path)) {
            shares.insert(share);
        }
    }
    return true;
}

bool ServiceStatus(std::string &status) {
    std::set<std::string> shares;
    if (!IndexableShares(shares)) {
        return false;
    }
    for (const std::string &share : shares) {
        char buffer[kPathSize] = {};
        if (QueuePathOf(share, buffer) < 0) {
            syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", records::kStatusQueue.module,
                   records::kStatusQueue.line, share.c_str());
            return false;
        }
        const std::string queue = buffer;
        if (!IsFileExist(queue) && !IsFileExist(queue + kQueueTmpSuffix)) {
            continue;
        }
        long long resumeTime = -1;
        if (!AskStatus([&](Status &stored) { return stored.GetPauseInfo(resumeTime); })) {
            return false;
        }
        status = ProgressOfWork(resumeTime);
        return true;
    }
    status = kFinished;  // a pause shows only while there is work
    return true;
}

}  // namespace

bool StatusMgr::GetStatus(std::string &status) {
    return NoThrow([&] { return ServiceStatus(status); });
}

std::string StatusMgr::GetFolderStatus(const std::string &path) {
    return FolderProgress(path);
}

}  // namespace FILEINDEX
}  // namespace VORK
