// "pause" and "resume".
#include "report/schedule.h"
#include "verbs/verb.h"

#include <ctime>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr long long kSecondsPerHour = 3600;

// "8h", "8", "1h30m", "2d": in seconds.
long long ParseDuration(const std::string &text) {
    static constexpr struct {
        char letter;
        long long seconds;
    } kUnits[] = {{'d', 24 * kSecondsPerHour}, {'h', kSecondsPerHour}, {'m', 60}};
    constexpr const char *kDigits = "0123456789";
    const bool isNumber = !text.empty() && text.find_first_not_of(kDigits) == std::string::npos;
    std::string rest = isNumber ? text + "h" : text;
    long long total = 0;
    for (const auto &unit : kUnits) {
        const auto digits = std::min(rest.find_first_not_of(kDigits), rest.size());
        if (digits > 0 && digits < rest.size() && rest[digits] == unit.letter) {
            const long long number = digits > 9 ? kLatestEnd : std::stoll(rest);  // enough to be refused
            total += std::min(number, kLatestEnd) * unit.seconds;
            rest.erase(0, digits + 1);
        }
    }
    if (!rest.empty() || (total == 0 && !isNumber)) {
        throw Failure(ExitStatus::kUsage,
                      Quoted(text) + " is no length of time: 8h, 90m, 1h30m, 2d, or 0 for a pause without an end");
    }
    if (std::time(nullptr) + total > kLatestEnd) {
        throw Failure(ExitStatus::kUsage, "a pause cannot end after " + LocalTime(kLatestEnd) +
                                              "; \"fileindexctl pause 0\" is one without an end");
    }
    return total;
}

// The next time that local clocks show HH:MM.
long long ParseUntil(const std::string &text) {
    std::tm clock{};
    const char *end = strptime(text.c_str(), "%H:%M", &clock);
    const bool isWhole =
        end != nullptr && *end == '\0' && text.find_first_not_of("0123456789:") == std::string::npos;
    if (!isWhole || text.find(':') + 3 != text.size()) {
        throw Failure(ExitStatus::kUsage, Quoted(text) + " is no time of day: HH:MM, from 00:00 to 23:59");
    }
    const std::time_t now = std::time(nullptr);
    for (int day = 0; day < 2; ++day) {
        std::tm local{};
        localtime_r(&now, &local);
        local.tm_mday += day;
        local.tm_hour = clock.tm_hour;
        local.tm_min = clock.tm_min;
        local.tm_sec = 0;
        local.tm_isdst = -1;
        const std::time_t then = std::mktime(&local);
        if (then > now) {
            return then;
        }
    }
    throw Failure(ExitStatus::kUsage, "the clock does not show " + text + " within a day");
}

ExitStatus Report(const StepReport &report, Output &output) {
    report.Show(output);
    long long resumeTime = kNotPaused;
    if (StatusMgr::GetPauseInfo(resumeTime)) {
        output.Data()["resume_time"] = ToNumber(resumeTime);
        output.Line(PauseText(resumeTime));
    }
    return output.Conclude(report.Status(),
                           "this is saved, but fileindexd does not know; once it runs, repeat the command");
}

}  // namespace

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
        return Report(SetPause(resumeTime, "saved", patience), output);
    }
    const long long seconds = arguments.Has("TIME") ? ParseDuration(arguments.One("TIME")) : 0;
    if (seconds % kSecondsPerHour != 0) {
        return Report(SetPause(std::time(nullptr) + seconds, "saved", patience), output);
    }
    return Report(PauseForHours(static_cast<int>(seconds / kSecondsPerHour), "saved", patience), output);
}

ExitStatus ResumeIndexing(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    return Report(SetPause(kNotPaused, "saved", patience), output);
}

}  // namespace VORK::FILEINDEXCTL
