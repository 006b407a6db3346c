#include "report/schedule.h"

#include "facts/config_lock.h"
#include "facts/progress.h"
#include "report/failure.h"
#include "report/steps.h"

#include <fileindex/daemon.h>
#include <fileindex/status.h>
#include <fileindex/status_mgr.h>

#include <algorithm>
#include <array>
#include <ctime>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::Status;
using VORK::FILEINDEX::StatusMgr;

std::vector<PlannedStep> Plan(const VORK::FILEINDEX::internal::Record &failure, const std::string &saved) {
    return {SaveStep(saved), {"daemon told", "fileindexd cannot be reached", {{failure}}}};
}

// StatusMgr::Pause counts in whole hours from now; for any other end its steps are taken one by one.
StepReport PauseUntil(long long resumeTime, const std::string &saved, Patience &patience) {
    ForgetErrors();
    Status status;
    const ConfigLock lock(status, patience);
    if (!lock.IsHeld() || !status.Load() || !status.Pause(resumeTime) || !status.Save()) {
        throw FailureOf(status);
    }
    StepReport report;
    report.Add(saved, StepResult::kDone);
    Json::Value data(Json::objectValue);
    data["resume_time"] = static_cast<Json::Int64>(resumeTime);
    const bool told = VORK::FILEINDEX::SendCammandToDaemon("pause", data);
    report.Add("daemon told", told, "fileindexd cannot be reached");
    return report;
}

}  // namespace

std::string LocalTime(long long seconds, const char *format) {
    const auto time = static_cast<std::time_t>(seconds);
    std::tm local{};
    std::array<char, 64> text{};
    if (localtime_r(&time, &local) == nullptr || std::strftime(text.data(), text.size(), format, &local) == 0) {
        return std::to_string(seconds);
    }
    return text.data();
}

StepReport PauseForHours(int hours, const std::string &saved, Patience &patience) {
    return StepReport::Perform(Plan(records::kPauseSend, saved), Status(), patience,
                               [&] { return StatusMgr::Pause(hours); });
}

StepReport SetPause(long long resumeTime, const std::string &saved, Patience &patience) {
    if (resumeTime == kNotPaused) {
        return StepReport::Perform(Plan(records::kResumeSend, saved), Status(), patience,
                                   [] { return StatusMgr::Resume(); });
    }
    return resumeTime == kWithoutEnd ? PauseForHours(0, saved, patience) : PauseUntil(resumeTime, saved, patience);
}

std::string PauseText(long long resumeTime) {
    if (resumeTime == kWithoutEnd) {
        return "indexing is paused without an end";
    }
    if (resumeTime < kWithoutEnd) {  // the files may hold other such numbers than -1
        return "indexing is not paused";
    }
    if (resumeTime <= std::time(nullptr)) {
        return "indexing is not paused; a pause ended at " + LocalTime(resumeTime);
    }
    return "indexing is paused until " + LocalTime(resumeTime);
}

std::string AgeText(const std::optional<long long> &since) {
    if (!since) {
        return "-";
    }
    return DurationText(static_cast<double>(std::max<long long>(0, std::time(nullptr) - *since)));
}

bool IsPaused(long long resumeTime) {
    return resumeTime == kWithoutEnd || resumeTime > std::time(nullptr);
}

}  // namespace VORK::FILEINDEXCTL
