#include "index_mgr/events.h"

#include "names.h"
#include "no_throw.h"
#include "records.h"

#include <fileindex/error.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>

#include <syslog.h>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace internal {

PendingReindexes PendingReindexesOf(const Json::Value &reports) {
    return PendingReindexes(reports.getMemberNames());
}

bool UpdateOne(PendingReindexes &pending, const std::string &path, const Json::Value &data) {
    std::string fullPath;
    if (!GetFullPath(fullPath, path)) {
        syslog(LOG_ERR, "%s:%d GetFullPath failed, path=%s", records::kUpdatePath.module,
               records::kUpdatePath.line, path.c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_PATH);
        return false;
    }
    if (!AddEvent(pending, kSettingEvent, fullPath, path, data)) {
        syslog(LOG_ERR, "%s:%d AddCustomEvent failed", records::kUpdateEvent.module, records::kUpdateEvent.line);
        if (!CanBeQueued(data)) {
            ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
        }
        return false;
    }
    return true;
}

}  // namespace internal

bool IndexMgr::Update(const std::string &path, const Json::Value &data) {
    return NoThrow([&] {
        PendingReindexes pending({path});
        return UpdateOne(pending, path, data);
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
