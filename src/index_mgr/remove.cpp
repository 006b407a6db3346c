#include "base/json/elements.h"
#include "base/json/text.h"
#include "config/unlocker.h"
#include "folders/folder_access.h"
#include "index_mgr/changes.h"
#include "index_mgr/events.h"
#include "index_mgr/share_folders.h"
#include "index_mgr/stop_indexing.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"

#include <fileindex/daemon.h>
#include <fileindex/error.h>
#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>

#include <syslog.h>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

constexpr StopRecords kStopRecords = {records::kDeleteStop, records::kDeleteSearch, records::kDeleteRestart};

bool BadParam(const Json::Value &what) {
    syslog(LOG_ERR, "%s:%d Bad param: %s", records::kDeleteRequest.module, records::kDeleteRequest.line,
           ToString(what).c_str());
    ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
    return false;
}

/// In memory only: a batch that fails half way changes nothing in folder.conf.
bool DeleteAll(Folders &store, const Json::Value &paths, Changes &changes) {
    for (const Json::Value &element : Elements(paths)) {
        if (!element.isString()) {
            return BadParam(element);
        }
        const std::string path = element.asString();
        Json::Value report;
        if (!store.Delete(report, path)) {
            syslog(LOG_ERR, "%s:%d Delete failed, path=%s", records::kDeleteElement.module,
                   records::kDeleteElement.line, path.c_str());
            return false;
        }
        if (!changes.Add(path, report, records::kDeleteShare)) {
            return false;
        }
    }
    return true;
}

bool SendCommands(const Json::Value &paths) {
    Json::Value command(Json::objectValue);
    for (const Json::Value &path : Elements(paths)) {
        if (HasNul(path.asString())) {
            continue;  // the daemon may take it for another path; its event is refused below, with a record
        }
        command[kFolderPathKey] = path.asString();
        if (!SendCammandToDaemon(kDeleteCommand, command)) {
            syslog(LOG_ERR, "%s:%d SendCammandToDaemon failed", records::kDeleteSend.module,
                   records::kDeleteSend.line);
            return false;
        }
    }
    return true;
}

bool QueueEvents(const Json::Value &reports) {
    if (QueueReports(reports, {records::kUpdatePath, records::kUpdateEvent})) {
        return true;
    }
    syslog(LOG_ERR, "%s:%d Update failed", records::kDeleteEvent.module, records::kDeleteEvent.line);
    return false;
}

bool FollowShare(const Folders &saved, const std::string &share) {
    const bool isIndexed = IndexMgr::IsShareIndexed(share);
    if (isIndexed && IndexMgr::UpsertVorkNotifydCfg(share)) {
        return true;
    }
    // "No" can also mean that folder.conf could not be read again. Cleaning then would delete the index of a share
    // that is in use; what was just saved decides.
    if (isIndexed || !FoldersOf(saved, share).empty()) {
        syslog(LOG_ERR, "%s:%d UpsertVorkNotifydCfg failed, share=%s", records::kDeleteMonitor.module,
               records::kDeleteMonitor.line, share.c_str());
        return false;
    }
    if (!IndexMgr::CleanShareIndexData(share)) {
        syslog(LOG_ERR, "%s:%d CleanShareIndexData failed, share=%s", records::kDeleteClean.module,
               records::kDeleteClean.line, share.c_str());
        return false;
    }
    if (!IndexMgr::DeleteVorkNotifydCfg(share)) {
        syslog(LOG_ERR, "%s:%d DeleteVorkNtifydCfg failed, share=%s", records::kDeleteWithdraw.module,
               records::kDeleteWithdraw.line, share.c_str());
        return false;
    }
    return true;
}

}  // namespace

bool IndexMgr::Delete(const Json::Value &paths) {
    return NoThrow([&] {
        if (!paths.isArray()) {
            return BadParam(paths);
        }
        Folders store;
        const ConfigUnlocker unlocker(store);
        Changes changes;
        if (!store.Lock(true) || !FolderAccess::Load(store) || !DeleteAll(store, paths, changes) ||
            !FolderAccess::Save(store)) {
            return false;
        }
        if (IsEmpty(store)) {
            StopIndexing(kStopRecords);  // nobody is left to hear of commands and events
        } else if (!SendCommands(paths) || !QueueEvents(changes.reports)) {
            return false;
        }
        for (const std::string &share : changes.shares) {
            if (!FollowShare(store, share)) {
                return false;
            }
        }
        return true;
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
