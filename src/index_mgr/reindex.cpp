#include "base/json/elements.h"
#include "base/json/text.h"
#include "index_mgr/events.h"
#include "no_throw.h"
#include "queue/events.h"
#include "records.h"

#include <fileindex/error.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>
#include <fileindex/status_mgr.h>

#include <syslog.h>

#include <set>
#include <vector>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

bool Malformed(const Json::Value &what, const Record &record) {
    syslog(LOG_ERR, "%s:%d Malformed jsArrPath: %s", record.module, record.line, ToString(what).c_str());
    ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
    return false;
}

/// Checks the whole request before anything is changed, and finds the shares that are out of space.
bool Check(const Json::Value &paths, std::set<std::string> &outOfSpace) {
    std::set<std::string> indexed;  // one look at folder.conf for each share, however many paths it has
    for (const Json::Value &element : Elements(paths)) {
        if (!element.isString()) {
            return Malformed(element, records::kReindexElement);
        }
        const std::string path = element.asString();
        std::string share;
        if (!GetShareNameByPath(share, path)) {
            syslog(LOG_ERR, "%s:%d Failed to get share name from path: %s", records::kReindexShare.module,
                   records::kReindexShare.line, path.c_str());
            return false;
        }
        if (!indexed.contains(share) && !IndexMgr::IsShareIndexed(share)) {
            return false;
        }
        indexed.insert(share);
        if (StatusMgr::ShareIsNoSpace(share)) {
            outOfSpace.insert(share);
        }
    }
    return true;
}

std::vector<std::string> Strings(const Json::Value &array) {
    std::vector<std::string> strings;
    strings.reserve(array.size());
    for (const Json::Value &element : Elements(array)) {
        strings.push_back(element.asString());
    }
    return strings;
}

}  // namespace

bool IndexMgr::Reindex(const Json::Value &jsArrPath) {
    return NoThrow([&] {
        if (!jsArrPath.isArray()) {
            return Malformed(jsArrPath, records::kReindexRequest);
        }
        std::set<std::string> outOfSpace;
        if (!Check(jsArrPath, outOfSpace)) {
            return false;
        }
        for (const std::string &share : outOfSpace) {
            if (!StatusMgr::ShareRevive(share)) {
                // The events below are worth queuing even so: the daemon finds them when the share is revived.
                syslog(LOG_ERR, "%s:%d ShareRevice failed, share=%s", records::kReindexRevive.module,
                       records::kReindexRevive.line, share.c_str());
            }
        }
        PendingReindexes pending(Strings(jsArrPath));
        for (const Json::Value &element : Elements(jsArrPath)) {
            const std::string path = element.asString();
            std::string fullPath;
            if (!ResolveForEvent(fullPath, path, records::kReindexPath)) {
                return false;
            }
            if (!AddEvent(pending, kReindexEvent, fullPath, path, Json::Value())) {
                syslog(LOG_ERR, "%s:%d AddCustomEvent failed, path=%s", records::kReindexEvent.module,
                       records::kReindexEvent.line, path.c_str());
                return false;
            }
        }
        return true;
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
