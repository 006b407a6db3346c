#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"
#include "status/access.h"

#include <fileindex/daemon.h>
#include <fileindex/error.h>
#include <fileindex/status_mgr.h>

#include <json/value.h>

#include <syslog.h>

#include <cstdint>
#include <ctime>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

/// A command that announces a saved change, and the record when it cannot be sent.
struct Announcement {
    const char *command;
    Json::Value data;
    Record failure;
    bool canBeSent = true;

    /// A failure leaves the change saved: the daemon reads the file when it starts.
    bool Send() const {
        if (canBeSent && SendCammandToDaemon(command, data)) {
            return true;
        }
        syslog(LOG_ERR, "%s:%d SendCammandToDaemon failed", failure.module, failure.line);
        return false;
    }
};

/// In 32 bits, as the daemon computes it: an end past January 2038 wraps to the past, and the daemon resumes at
/// once instead of never.
long long ResumeTimeIn(int hours) {
    if (hours == 0) {
        return 0;
    }
    const auto now = static_cast<std::uint32_t>(time(nullptr));
    return static_cast<std::int32_t>(now + 3600U * static_cast<std::uint32_t>(hours));
}

Json::Value Object(const char *key, const Json::Value &value) {
    Json::Value object(Json::objectValue);
    object[key] = value;
    return object;
}

}  // namespace

bool StatusMgr::Pause(const int &hours) {
    if (hours < 0) {
        ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
        return false;
    }
    return NoThrow([&] {
        const long long resumeTime = ResumeTimeIn(hours);
        const Announcement pause = {kPauseCommand, Object(kResumeTimeKey, static_cast<Json::Int64>(resumeTime)),
                                    records::kPauseSend};
        return ChangeStatus([&](Status &status) { return status.Pause(resumeTime); },
                            [&] { return pause.Send(); });
    });
}

bool StatusMgr::Resume() {
    return NoThrow([] {
        const Announcement resume = {kResumeCommand, Json::Value(Json::objectValue), records::kResumeSend};
        return ChangeStatus([](Status &status) { return status.Resume(); }, [&] { return resume.Send(); });
    });
}

bool StatusMgr::GetPauseInfo(long long &resumeTime) {
    return AskStatus([&](Status &status) { return status.GetPauseInfo(resumeTime); });
}

bool StatusMgr::ShareSetNoSpace(const std::string &share, bool noSpace) {
    return ChangeStatus([&](Status &status) { return status.ShareSetNoSpace(share, noSpace); });
}

bool StatusMgr::ShareIsNoSpace(const std::string &share) {
    return AskStatus([&](Status &status) { return status.ShareIsNoSpace(share); });
}

bool StatusMgr::ShareRevive(const std::string &share) {
    return NoThrow([&] {
        // The daemon may take a name with a NUL for that of another share.
        const Announcement revive = {kReviveShareCommand, Object(kShareNameKey, share), records::kReviveSend,
                                     !HasNul(share)};
        return ChangeStatus([&](Status &status) { return status.ShareSetNoSpace(share, false); },
                            [&] { return revive.Send(); });
    });
}

bool StatusMgr::ShareSetNeedReindex(const std::string &share, bool needReindex) {
    return ChangeStatus([&](Status &status) { return status.ShareSetNeedReindex(share, needReindex); });
}

bool StatusMgr::ShareIsNeedReindex(const std::string &share) {
    return AskStatus([&](Status &status) { return status.ShareIsNeedReindex(share); });
}

bool StatusMgr::SetUpdated(const std::string &key) {
    return ChangeStatus([&](Status &status) { return status.SetUpdated(key); });
}

bool StatusMgr::IsUpdated(const std::string &key) {
    return AskStatus([&](Status &status) { return status.IsUpdated(key); });
}

}  // namespace FILEINDEX
}  // namespace VORK
