#include "daemon/services.h"
#include "folders/folder_access.h"
#include "no_throw.h"
#include "records.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>
#include <fileindex/updater.h>

#include <syslog.h>

#include <set>
#include <string>
#include <vector>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

bool StartIndexing(const std::vector<Folder> &folders) {
    if (!StartDaemon(records::kUpgradeStart) || !SetSearch(!folders.empty(), records::kUpgradeSearch)) {
        return false;
    }
    std::set<std::string> shares;
    Json::Value paths(Json::arrayValue);
    for (const Folder &folder : folders) {
        std::string share;
        if (!GetShareNameByPath(share, folder.path)) {
            syslog(LOG_ERR, "%s:%d GetShareNameByPath failed, path=%s", records::kUpgradeShare.module,
                   records::kUpgradeShare.line, folder.path.c_str());
            return false;
        }
        shares.insert(share);
        paths.append(folder.path);
    }
    for (const std::string &share : shares) {
        if (!IndexMgr::UpsertVorkNotifydCfg(share)) {
            syslog(LOG_ERR, "%s:%d UpsertVorkNotifydCfg failed, share=%s", records::kUpgradeMonitor.module,
                   records::kUpgradeMonitor.line, share.c_str());
            return false;
        }
    }
    if (!IndexMgr::Reindex(paths)) {
        syslog(LOG_ERR, "%s:%d Reindex failed", records::kUpgradeReindex.module, records::kUpgradeReindex.line);
        return false;
    }
    return true;
}

}  // namespace

bool Updater_zol60_beta2() {
    return NoThrow([] {
        Folders store;
        std::vector<Folder> folders;
        if (!FolderAccess::Load(store) || !store.List(folders)) {
            return false;
        }
        return folders.empty() ? StopDaemonAfterUpgrade() : StartIndexing(folders);
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
