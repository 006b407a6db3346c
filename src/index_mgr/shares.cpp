#include "config/unlocker.h"
#include "folders/folder_access.h"
#include "index_mgr/share_folders.h"
#include "index_mgr/stop_indexing.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"

#include <fileindex/daemon.h>
#include <fileindex/fileidx.h>
#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>

#include <vork/process.h>

#include <syslog.h>

#include <vector>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

constexpr StopRecords kStopRecords = {records::kShareRemoveStop, records::kShareRemoveSearch,
                                      records::kShareRemoveRestart};

bool SendShareCommand(const char *command, const std::string &share) {
    Json::Value data(Json::objectValue);
    data[kShareNameKey] = share;
    return SendCammandToDaemon(command, data);
}

/// One that fills the buffer may be cut, and then names something else.
bool IsWhole(int length) {
    return length >= 0 && length < kPathSize - 1;
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
        if (!store.Lock(true) || !FolderAccess::Load(store)) {
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
        return FolderAccess::Save(store);
    });
}

bool IndexMgr::ShareRemove(const std::string &share) {
    return NoThrow([&] {
        Folders store;
        const ConfigUnlocker unlocker(store);
        if (!store.Lock(true) || !FolderAccess::Load(store)) {
            return false;
        }
        Json::Value scratch;
        for (const Folder &folder : FoldersOf(store, share)) {
            if (!store.Delete(scratch, folder.path)) {
                return false;
            }
        }
        if (!FolderAccess::Save(store)) {
            return false;
        }
        if (IsEmpty(store)) {
            StopIndexing(kStopRecords);
        }
        return true;
    });
}

bool IndexMgr::SharePause(const std::string &share) {
    return NoThrow([&] {
        // The daemon may take a name with a NUL for that of another share. The next step refuses it, with a
        // record.
        if (!HasNul(share) && !SendShareCommand(kDeleteShareCommand, share)) {
            return false;
        }
        if (!DeleteVorkNotifydCfg(share)) {
            syslog(LOG_ERR, "%s:%d DeleteVorkNotifydCfg failed, share=%s", records::kSharePauseWithdraw.module,
                   records::kSharePauseWithdraw.line, share.c_str());
            return false;
        }
        return true;
    });
}

bool IndexMgr::ShareResume(const std::string &share) {
    return NoThrow([&] {
        if (!UpsertVorkNotifydCfg(share)) {
            syslog(LOG_ERR, "%s:%d UpsertVorkNotifydCfg failed, share=%s", records::kShareResumeMonitor.module,
                   records::kShareResumeMonitor.line, share.c_str());
            return false;
        }
        return SendShareCommand(kReviveShareCommand, share);
    });
}

bool IndexMgr::CleanShareIndexData(const std::string &share) {
    return NoThrow([&] {
        char location[kPathSize] = {};
        if (!IsWhole(QueuePathOf(share, location))) {
            syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", records::kCleanQueue.module,
                   records::kCleanQueue.line, share.c_str());
            return false;
        }
        Remove(location);
        Remove(std::string(location) + kQueueTmpSuffix);
        if (!IsWhole(FILEIDXDBPathGet(share.c_str(), location, sizeof(location)))) {
            syslog(LOG_ERR, "%s:%d FILEIDXDBPathGet failed, share=%s", records::kCleanDatabase.module,
                   records::kCleanDatabase.line, share.c_str());
            return false;
        }
        Remove(location);
        return true;
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
