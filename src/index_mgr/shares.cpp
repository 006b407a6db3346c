#include "index_mgr/share_folders.h"
#include "index_mgr/stop_indexing.h"
#include "names.h"
#include "no_throw.h"
#include "scoped.h"
#include "utils/storage.h"

#include <fileindex/daemon.h>
#include <fileindex/fileidx.h>
#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>

#include <vork/process.h>

#include <sys/stat.h>
#include <syslog.h>

#include <vector>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

constexpr StopIndexingLines kStopLines = {535, 540, 542};

bool SendShareCommand(const char *command, const std::string &share) {
    Json::Value data(Json::objectValue);
    data[kShareNameKey] = share;
    return SendCammandToDaemon(command, data);
}

/// A location that is surely the share's own. One that fills the buffer may be cut, and then names something
/// else; one behind a link in place of the metadata directory lies outside the share.
bool IsOwnLocation(const char (&location)[kPathSize], int length) {
    if (length < 0 || length >= kPathSize - 1) {
        return false;
    }
    const std::string path = location;
    struct stat status = {};
    return lstat(path.substr(0, path.rfind('/')).c_str(), &status) != 0 || !S_ISLNK(status.st_mode);
}

/// The result is of no use: what cannot be deleted now is deleted with the share, or reused.
void Remove(const std::string &path) {
    (void)VLIBCExec("/bin/rm", "-rf", path.c_str(), nullptr, nullptr);
}

}  // namespace

bool IndexMgr::ShareRename(const std::string &oldShare, const std::string &newShare) {
    return NoThrow([&] {
        Folders store;
        const ConfigUnlocker unlocker(store);
        if (!store.Lock(true) || !store.Load()) {
            return false;
        }
        Json::Value scratch;
        for (Folder &folder : FoldersOf(store, oldShare)) {
            if (!store.Delete(scratch, folder.path)) {
                return false;
            }
            folder.SetPath(ReplaceShareName(folder.path, newShare));
            if (!store.Upsert(scratch, folder.asJson())) {
                return false;
            }
        }
        return store.Save();
    });
}

bool IndexMgr::ShareRemove(const std::string &share) {
    return NoThrow([&] {
        Folders store;
        const ConfigUnlocker unlocker(store);
        if (!store.Lock(true) || !store.Load()) {
            return false;
        }
        Json::Value scratch;
        for (const Folder &folder : FoldersOf(store, share)) {
            if (!store.Delete(scratch, folder.path)) {
                return false;
            }
        }
        if (!store.Save()) {
            return false;
        }
        if (IsEmpty(store)) {
            StopIndexing(kStopLines);
        }
        return true;
    });
}

bool IndexMgr::SharePause(const std::string &share) {
    return NoThrow([&] {
        if (!SendShareCommand(kDeleteShareCommand, share)) {
            return false;
        }
        if (!DeleteVorkNotifydCfg(share)) {
            syslog(LOG_ERR, "%s:%d DeleteVorkNotifydCfg failed, share=%s", kIndexMgrModule, 484, share.c_str());
            return false;
        }
        return true;
    });
}

bool IndexMgr::ShareResume(const std::string &share) {
    return NoThrow([&] {
        if (!UpsertVorkNotifydCfg(share)) {
            syslog(LOG_ERR, "%s:%d UpsertVorkNotifydCfg failed, share=%s", kIndexMgrModule, 501, share.c_str());
            return false;
        }
        return SendShareCommand(kReviveShareCommand, share);
    });
}

bool IndexMgr::CleanShareIndexData(const std::string &share) {
    return NoThrow([&] {
        char location[kPathSize] = {};
        if (!IsOwnLocation(location, QueuePathOf(share, location))) {
            syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", kIndexMgrModule, 653, share.c_str());
            return false;
        }
        Remove(location);
        Remove(std::string(location) + kQueueTmpSuffix);
        if (!IsOwnLocation(location, FILEIDXDBPathGet(share.c_str(), location, sizeof(location)))) {
            syslog(LOG_ERR, "%s:%d FILEIDXDBPathGet failed, share=%s", kIndexMgrModule, 661, share.c_str());
            return false;
        }
        Remove(location);
        return true;
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
