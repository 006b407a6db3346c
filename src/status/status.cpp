#include "names.h"
#include "records.h"

#include <fileindex/daemon.h>
#include <fileindex/status.h>

#include <json/value.h>

#include <syslog.h>

namespace VORK {
namespace FILEINDEX {

using internal::kNeedReindexKey;
using internal::kNoSpaceKey;
using internal::kResumeTimeKey;
namespace records = internal::records;

namespace {

constexpr int kNotPaused = -1;

/// Marks or unmarks `share` in root[flagKey]. If that is missing, unmarking makes it a null. If it has an
/// unexpected type, it stays as it is: the JSON library throws, and nothing of the file is lost. `beforeFirst`
/// runs when the share is not marked yet, even if it then cannot be marked: the administrators should know of it
/// all the same.
template <typename BeforeFirst>
void SetShareFlag(Json::Value &root, const char *flagKey, const std::string &share, bool set,
                  BeforeFirst beforeFirst) {
    Json::Value &flags = root[flagKey];
    if (!set) {
        if (flags.isMember(share)) {
            flags.removeMember(share, nullptr);  // the form without a result takes a name up to its first NUL only
        }
        return;
    }
    if (!flags.isObject() || !flags.isMember(share)) {
        beforeFirst();
    }
    flags[share] = true;
}

bool HasShareFlag(const Json::Value &root, const char *flagKey, const std::string &share) {
    if (!root.isObject() || !root.isMember(flagKey)) {
        return false;
    }
    const Json::Value &flags = root[flagKey];
    return flags.isObject() && flags.isMember(share);
}

}  // namespace

Status::Status() = default;

Status::~Status() = default;

bool Status::Load() {
    return LoadJson();
}

bool Status::Save() {
    return SaveJson();
}

std::string Status::GetLockPath() const {
    return internal::kStatusLock;
}

std::string Status::GetPath() const {
    return internal::kStatusConf;
}

bool Status::Pause(long long resumeTime) {
    document_[kResumeTimeKey] = static_cast<Json::Int64>(resumeTime);
    return true;
}

bool Status::Resume() {
    document_[kResumeTimeKey] = kNotPaused;
    return true;
}

bool Status::GetPauseInfo(long long &resumeTime) {
    try {
        resumeTime = document_.get(kResumeTimeKey, kNotPaused).asInt64();
        return true;
    } catch (const Json::Exception &) {
        syslog(LOG_ERR, "%s:%d json exception", records::kPauseInfo.module, records::kPauseInfo.line);
        return false;
    }
}

bool Status::ShareSetNoSpace(const std::string &share, bool noSpace) {
    SetShareFlag(document_, kNoSpaceKey, share, noSpace, [] {
        if (!NotifyNoSpace()) {
            syslog(LOG_ERR, "%s:%d NotifyNoSpace failed", records::kNotifyNoSpace.module,
                   records::kNotifyNoSpace.line);
        }
    });
    return true;
}

bool Status::ShareIsNoSpace(const std::string &share) {
    return HasShareFlag(document_, kNoSpaceKey, share);
}

bool Status::ShareSetNeedReindex(const std::string &share, bool needReindex) {
    SetShareFlag(document_, kNeedReindexKey, share, needReindex, [] {});
    return true;
}

bool Status::ShareIsNeedReindex(const std::string &share) {
    return HasShareFlag(document_, kNeedReindexKey, share);
}

bool Status::SetUpdated(const std::string &key) {
    document_[key] = true;
    return true;
}

bool Status::IsUpdated(const std::string &key) {
    if (!document_.isObject() || !document_.isMember(key)) {
        return false;
    }
    const Json::Value &marker = document_[key];
    return marker.isConvertibleTo(Json::booleanValue) && marker.asBool();
}

}  // namespace FILEINDEX
}  // namespace VORK
