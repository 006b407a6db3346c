#include "report/schedule.h"

#include "command_line/handlers.h"
#include "facts/config_lock.h"
#include "facts/progress.h"
#include "report/failure.h"
#include "report/steps.h"

#include <fileindex/daemon.h>
#include <fileindex/status.h>
#include <fileindex/status_mgr.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <ctime>
#include <iterator>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::Status;
using VORK::FILEINDEX::StatusMgr;

constexpr long long kNotPaused = -1;
constexpr long long kWithoutEnd = 0;
constexpr long long kSecondsPerHour = 3600;

std::vector<PlannedStep> Plan(const VORK::FILEINDEX::internal::Record &failure,
                              const std::string &saved = "saved") {
    return {SaveStep(saved), {"daemon told", "fileindexd cannot be reached", {{failure}}}};
}

std::string LocalTime(long long seconds) {
    const auto time = static_cast<std::time_t>(seconds);
    std::tm local{};
    std::array<char, 64> text{};
    if (localtime_r(&time, &local) == nullptr ||
        std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M %Z", &local) == 0) {
        return std::to_string(seconds);
    }
    return text.data();
}

bool IsNumber(const std::string &text) {
    return !text.empty() && text.find_first_not_of("0123456789") == std::string::npos;
}

// "8h", "8", "1h30m", "2d": in seconds, at most more than any pause can take.
long long ParseDuration(const std::string &text) {
    static constexpr struct {
        char letter;
        long long seconds;
    } kUnits[] = {{'d', 24 * kSecondsPerHour}, {'h', kSecondsPerHour}, {'m', 60}};
    long long total = 0;
    const auto *unit = std::begin(kUnits);
    std::string rest = IsNumber(text) ? text + "h" : text;
    while (!rest.empty()) {
        const auto digits = rest.find_first_not_of("0123456789");
        unit = digits == std::string::npos || digits == 0
                   ? std::end(kUnits)
                   : std::find_if(unit, std::end(kUnits),
                                  [&](const auto &row) { return row.letter == rest[digits]; });
        if (unit == std::end(kUnits)) {
            total = -1;
            break;
        }
        const long long number = digits > 9 ? kLatestEnd : std::stoll(rest);
        total += std::min(number, kLatestEnd) * unit->seconds;
        rest.erase(0, digits + 1);
        ++unit;
    }
    if (text.empty() || total < 0 || (total == 0 && !IsNumber(text))) {
        throw Failure(
            ExitStatus::kUsage,
            "\"" + text + "\" is no length of time: 8h, 90m, 1h30m, 2d, or 0 for a pause without an end");
    }
    if (std::time(nullptr) + total > kLatestEnd) {
        throw Failure(ExitStatus::kUsage, "a pause cannot end after " + LocalTime(kLatestEnd) +
                                              "; \"fileindexctl pause 0\" is one without an end");
    }
    return total;
}

// The next time that local clocks show HH:MM.
long long ParseUntil(const std::string &text) {
    const auto colon = text.find(':');
    const bool shaped = (colon == 1 || colon == 2) && text.size() == colon + 3 &&
                        IsNumber(text.substr(0, colon)) && IsNumber(text.substr(colon + 1));
    const int hour = shaped ? std::stoi(text.substr(0, colon)) : 24;
    const int minute = shaped ? std::stoi(text.substr(colon + 1)) : 60;
    if (hour > 23 || minute > 59) {
        throw Failure(ExitStatus::kUsage, "\"" + text + "\" is no time of day: HH:MM, from 00:00 to 23:59");
    }
    const std::time_t now = std::time(nullptr);
    for (int day = 0; day < 2; ++day) {
        std::tm local{};
        localtime_r(&now, &local);
        local.tm_mday += day;
        local.tm_hour = hour;
        local.tm_min = minute;
        local.tm_sec = 0;
        local.tm_isdst = -1;
        const std::time_t then = std::mktime(&local);
        if (then > now) {
            return then;
        }
    }
    throw Failure(ExitStatus::kUsage, "the clock does not show " + text + " within a day");
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
    report.Add("daemon told", told ? StepResult::kDone : StepResult::kFailed,
               told ? "" : "fileindexd cannot be reached");
    return report;
}

ExitStatus Report(const StepReport &report, Output &output) {
    report.Show(output);
    long long resumeTime = kNotPaused;
    if (StatusMgr::GetPauseInfo(resumeTime)) {
        output.Data()["resume_time"] = static_cast<Json::Int64>(resumeTime);
        output.Line(PauseText(resumeTime));
    }
    if (report.Status() != ExitStatus::kDone) {
        output.Error(report.Status(),
                     "this is saved, but fileindexd does not know; once it runs, repeat the command");
    }
    return report.Status();
}

}  // namespace

StepReport SetPause(long long resumeTime, const std::string &saved, Patience &patience) {
    if (resumeTime == kNotPaused) {
        return StepReport::Perform(Plan(records::kResumeSend, saved), Status(), patience,
                                   [] { return StatusMgr::Resume(); });
    }
    if (resumeTime == kWithoutEnd) {
        return StepReport::Perform(Plan(records::kPauseSend, saved), Status(), patience,
                                   [] { return StatusMgr::Pause(0); });
    }
    return PauseUntil(resumeTime, saved, patience);
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

ExitStatus PauseIndexing(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    if (arguments.Has("TIME") + arguments.Has("--until") + arguments.Has("--run") > 1) {
        throw Failure(ExitStatus::kUsage, "give a length of time, --until or --run, not several of them");
    }
    if (arguments.Has("--run")) {
        if (arguments.All("--run").front().starts_with("-")) {
            throw Failure(ExitStatus::kUsage, "--run: a command is expected, not an option");
        }
        return PauseWhile(arguments.All("--run"), patience, output);
    }
    if (arguments.Has("--until")) {
        const long long resumeTime = ParseUntil(arguments.One("--until"));
        return Report(PauseUntil(resumeTime, "saved", patience), output);
    }
    const long long seconds = arguments.Has("TIME") ? ParseDuration(arguments.One("TIME")) : 0;
    if (seconds % kSecondsPerHour != 0) {
        return Report(PauseUntil(std::time(nullptr) + seconds, "saved", patience), output);
    }
    const int hours = static_cast<int>(seconds / kSecondsPerHour);
    return Report(StepReport::Perform(Plan(records::kPauseSend), Status(), patience,
                                      [&] { return StatusMgr::Pause(hours); }),
                  output);
}

ExitStatus ResumeIndexing(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    return Report(
        StepReport::Perform(Plan(records::kResumeSend), Status(), patience, [] { return StatusMgr::Resume(); }),
        output);
}

}  // namespace VORK::FILEINDEXCTL
