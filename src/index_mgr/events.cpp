#include "index_mgr/events.h"

#include "no_throw.h"
#include "queue/events.h"

#include <fileindex/error.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>

#include <syslog.h>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

bool QueueSetting(PendingReindexes &pending, const std::string &path, const Json::Value &data,
                  const EventRecords &failures) {
    std::string fullPath;
    if (!ResolveForEvent(fullPath, path, failures.path)) {
        return false;
    }
    if (!AddEvent(pending, kSettingEvent, fullPath, path, data)) {
        syslog(LOG_ERR, "%s:%d AddCustomEvent failed", failures.event.module, failures.event.line);
        if (!CanBeQueued(data)) {
            ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
        }
        return false;
    }
    return true;
}

}  // namespace

namespace internal {

bool ResolveForEvent(std::string &fullPath, const std::string &path, const Record &failure) {
    if (GetFullPath(fullPath, path)) {
        return true;
    }
    syslog(LOG_ERR, "%s:%d GetFullPath failed, path=%s", failure.module, failure.line, path.c_str());
    ErrorHandler::SetError(FILEINDEX_ERR_PATH);
    return false;
}

bool QueueReports(const Json::Value &reports, const EventRecords &failures) {
    PendingReindexes pending(reports.getMemberNames());
    for (auto report = reports.begin(); report != reports.end(); ++report) {
        if (!QueueSetting(pending, report.name(), *report, failures)) {
            return false;
        }
    }
    return true;
}

}  // namespace internal

bool IndexMgr::Update(const std::string &path, const Json::Value &data) {
    return NoThrow([&] {
        PendingReindexes pending({path});
        return QueueSetting(pending, path, data, {records::kUpdatePath, records::kUpdateEvent});
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
