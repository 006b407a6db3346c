#include "base/json/elements.h"
#include "base/json/text.h"
#include "config/unlocker.h"
#include "daemon/services.h"
#include "folders/folder_access.h"
#include "index_mgr/changes.h"
#include "index_mgr/events.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"

#include <fileindex/daemon.h>
#include <fileindex/error.h>
#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/json_access.h>

#include <syslog.h>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

/// The element's "path"; empty, which no folder has, when the element is no object or the member no string.
std::string PathOf(const Json::Value &element) {
    std::string path;
    RetrieveStringFromJsonObj(path, kPathKey, element);
    return path;
}

/// In memory only: a batch that fails half way changes nothing in folder.conf.
bool UpsertAll(Folders &store, const Json::Value &folders, Changes &changes) {
    for (const Json::Value &element : Elements(folders)) {
        const std::string path = PathOf(element);
        Json::Value report;
        if (!store.Upsert(report, element)) {
            syslog(LOG_ERR, "%s:%d Upsert failed, folder=%s", records::kUpsertElement.module,
                   records::kUpsertElement.line, ToString(element).c_str());
            return false;
        }
        if (!changes.Add(path, report, records::kUpsertShare)) {
            return false;
        }
    }
    return true;
}

bool RegisterMonitors(const std::set<std::string> &shares) {
    for (const std::string &share : shares) {
        if (!IndexMgr::UpsertVorkNotifydCfg(share)) {
            syslog(LOG_ERR, "%s:%d UpsertVorkNtifydCfg failed, share=%s", records::kUpsertMonitor.module,
                   records::kUpsertMonitor.line, share.c_str());
            return false;
        }
    }
    return true;
}

bool SendCommands(const Json::Value &folders) {
    Json::Value command(Json::objectValue);
    for (const Json::Value &element : Elements(folders)) {
        command[kFolderPathKey] = PathOf(element);
        if (!SendCammandToDaemon(kUpsertCommand, command)) {
            syslog(LOG_ERR, "%s:%d SendCammandToDaemon failed", records::kUpsertSend.module,
                   records::kUpsertSend.line);
            return false;
        }
    }
    return true;
}

}  // namespace

bool IndexMgr::Upsert(const Json::Value &folders) {
    return NoThrow([&] {
        if (!folders.isArray() || !CanBeWritten(folders)) {
            syslog(LOG_ERR, "%s:%d Bad param: %s", records::kUpsertRequest.module, records::kUpsertRequest.line,
                   ToString(folders).c_str());
            ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
            return false;
        }
        Folders store;
        const ConfigUnlocker unlocker(store);
        Changes changes;
        if (!store.Lock(true) || !FolderAccess::Load(store) || !UpsertAll(store, folders, changes) ||
            !FolderAccess::Save(store)) {
            return false;
        }
        // Saved before anyone is told, and never taken back: the daemons read the file when they hear of it, and
        // the same call repeated tells everyone again.
        if (!RegisterMonitors(changes.shares) || !StartDaemon(records::kUpsertStart)) {
            return false;
        }
        EnsureSearch(true, records::kUpsertSearch, records::kUpsertRestart);
        return SendCommands(folders) &&
               QueueReports(changes.reports, {records::kUpsertPath, records::kUpsertEvent});
    });
}

bool IndexMgr::Set(const Json::Value &folders) {
    return Upsert(folders);
}

bool IndexMgr::Add(const Json::Value &folders) {
    return Upsert(folders);
}

}  // namespace FILEINDEX
}  // namespace VORK
