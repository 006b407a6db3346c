#include "base/json/text.h"
#include "folders/folder_access.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>

#include <vorknotifyd/monitor_queue.h>

#include <syslog.h>

#include <memory>
#include <new>
#include <vector>

namespace VORK {
namespace FILEINDEX {

using namespace internal;
using VORKNOTIFYD::MonitorQueue;

namespace {

constexpr auto kQueueType = VORKNOTIFYD::MONITOR_QUEUE_TYPE_FILE;

bool WatchList(Json::Value &config, const std::vector<Folder> &folders) {
    Json::Value ignore(Json::arrayValue);
    ignore.append(kMetadataDir);  // the queue is in it, and each event would make another
    for (const Folder &folder : folders) {
        std::string fullPath;
        if (!GetFullPath(fullPath, folder.path)) {
            syslog(LOG_ERR, "%s:%d GetFullPath failed, path=%s", records::kMonitorFolder.module,
                   records::kMonitorFolder.line, folder.path.c_str());
            return false;
        }
        Json::Value entry(Json::objectValue);
        entry["path"] = fullPath;
        entry["mask"] = kMonitorMask;
        entry["ignore"] = ignore;
        config.append(entry);
    }
    return true;
}

}  // namespace

bool IndexMgr::UpsertVorkNotifydCfg(const std::string &share) {
    return NoThrow([&] {
        char queuePath[kPathSize] = {};
        if (QueuePathOf(share, queuePath) < 0) {
            syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", records::kMonitorQueue.module,
                   records::kMonitorQueue.line, share.c_str());
            return false;
        }
        Folders store;
        std::vector<Folder> folders;
        if (!FolderAccess::Load(store) || !store.List(folders, share)) {
            return false;
        }
        Json::Value config(Json::arrayValue);
        if (!WatchList(config, folders)) {
            return false;
        }
        Json::Value jsQueue(Json::objectValue);
        jsQueue["queue"] = queuePath;
        jsQueue["config"] = config;
        const std::unique_ptr<MonitorQueue> queue(new (std::nothrow) MonitorQueue(jsQueue));
        if (!queue) {
            syslog(LOG_ERR, "%s:%d Failed to create MonitorQueue, jsQueue=%s", records::kMonitorMemory.module,
                   records::kMonitorMemory.line, ToString(jsQueue).c_str());
            return false;
        }
        if (!MonitorQueue::Upsert(*queue, kMonitorName, kQueueType)) {
            // The words say Add although the call is an upsert; support tools know the record by them.
            syslog(LOG_ERR, "%s:%d MonitorQueue::Add failed", records::kMonitorRefused.module,
                   records::kMonitorRefused.line);
            return false;
        }
        return true;
    });
}

bool IndexMgr::DeleteVorkNotifydCfg(const std::string &share) {
    return NoThrow([&] {
        char queuePath[kPathSize] = {};
        if (QueuePathOf(share, queuePath) < 0) {
            syslog(LOG_ERR, "%s:%d FILEIDXQueuePathGet failed, share=%s", records::kWithdrawQueue.module,
                   records::kWithdrawQueue.line, share.c_str());
            return false;
        }
        if (!MonitorQueue::Delete(queuePath, kMonitorName, kQueueType)) {
            syslog(LOG_ERR, "%s:%d MonitorQueue::Delete failed", records::kWithdrawRefused.module,
                   records::kWithdrawRefused.line);
            return false;
        }
        return true;
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
