// "status": how far indexing is, once or for as long as somebody watches.
#include "facts/progress.h"
#include "facts/status_report.h"
#include "report/schedule.h"
#include "report/screen.h"
#include "verbs/verb.h"

#include <chrono>
#include <ctime>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr unsigned long kInterval = 2;
constexpr unsigned long kLongestInterval = 86400;

double Now() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

// A queue that was taken keeps the whole from being finished, with no line in it, too; not a folder.
std::string ProgressText(const StatusReport &report, const Progress &progress) {
    const bool isTaken = progress.Left() == 0 && !report.shares.empty() && report.Taken() != "nothing";
    return isTaken ? "a taken queue waits" : progress.Text();
}

void AddProgress(const Progress &progress, StatusReport &report) {
    report.data["progress"] = ToObject({{"left", ToNumber(progress.Left())},
                                        {"done", ToNumber(progress.Done())},
                                        {"per_second", OrNull(progress.Rate())},
                                        {"seconds_left", OrNull(progress.SecondsLeft())},
                                        {"seconds_without_progress", progress.SecondsWithoutProgress()}});
    report.data["time"] = ToNumber(std::time(nullptr));
    report.facts.push_back({"taken away", report.Taken()});
    report.facts.push_back({"progress", ProgressText(report, progress)});
}

StatusReport ReportOf(const Arguments &arguments) {
    return arguments.Has("PATH") ? ReportFolder(arguments.One("PATH")) : ReportService(arguments.One("--share"));
}

StatusReport Sample(const Arguments &arguments, Progress &progress) {
    StatusReport report = ReportOf(arguments);
    std::map<std::string, unsigned long> files;
    for (const auto &[name, backlog] : report.backlogs) {
        files.insert(backlog.files.begin(), backlog.files.end());
    }
    progress.Add(Now(), files);
    AddProgress(progress, report);
    return report;
}

// One line, for logs and for programs that read lines.
std::string Brief(const StatusReport &report, const Progress &progress) {
    std::vector<std::string> shares;
    std::vector<std::string> paused;
    for (const auto &[name, backlog] : report.backlogs) {
        shares.push_back(name + " " + std::to_string(backlog.Total()));
    }
    for (const auto &share : report.data["paused_shares"]) {
        paused.push_back(share.asString());
    }
    return LocalTime(std::time(nullptr), "%Y-%m-%dT%H:%M:%S%z") + ": " + report.state + ", " +
           std::to_string(report.Queued()) + " queued" + (shares.empty() ? "" : " (" + Enumerate(shares) + ")") +
           ", taken away: " + report.Taken() + ", " +
           (paused.empty() ? "" : "paused: " + Enumerate(paused) + ", ") + ProgressText(report, progress);
}

void Draw(const StatusReport &report, unsigned long interval, Screen &screen) {
    auto lines = report.Lines(Screen::Width());
    lines.emplace_back();
    for (const auto &warning : report.gaps.Warnings()) {
        lines.push_back("warning: " + warning);
    }
    lines.push_back("every " + std::to_string(interval) + " s; Ctrl-C ends it");
    screen.Draw(lines);
}

// False when nobody reads it any more.
bool Write(const StatusReport &report, const Progress &progress, Output &output) {
    output.Data() = report.data;
    output.Line(Brief(report, progress));
    for (const auto &warning : report.gaps.Warnings()) {
        output.Warn(warning);
    }
    return output.EndSample();
}

// The signal that is to end the program; 0 to go on.
int AwaitEnd(const Signals &signals, unsigned long interval, std::optional<Screen> &screen) {
    const int signal = signals.Await(interval);
    if (signal == SIGTSTP) {
        if (screen) {
            screen->Leave();
        }
        signals.Deliver(signal);
        if (screen) {
            screen->Enter();
        }
    }
    return signal == SIGTSTP || signal == SIGWINCH ? 0 : signal;
}

// Until the user or the system ends it.
void Watch(const Arguments &arguments, unsigned long interval, Output &output) {
    const Signals signals;
    std::optional<Screen> screen;
    if (Screen::IsUsable() && !output.IsJson()) {
        screen.emplace();
    }
    Progress progress;
    int signal = 0;
    while (signal == 0) {
        const StatusReport report = Sample(arguments, progress);
        if (screen) {
            Draw(report, interval, *screen);
        } else if (!Write(report, progress, output)) {
            return;
        }
        signal = AwaitEnd(signals, interval, screen);
    }
    if (screen) {
        screen.reset();
        output.Line("");  // after the "^C" of the terminal
    }
    if (signal != SIGINT) {
        signals.Deliver(signal);
    }
}

unsigned long Interval(const Arguments &arguments) {
    const unsigned long interval = arguments.Number("--interval", kInterval);
    if (arguments.Has("--interval") && !arguments.Has("--watch")) {
        throw Failure(ExitStatus::kUsage, "--interval goes with --watch");
    }
    if (interval == 0 || interval > kLongestInterval) {
        throw Failure(ExitStatus::kUsage, "--interval: 1 to " + std::to_string(kLongestInterval) + " seconds");
    }
    return interval;
}

}  // namespace

ExitStatus ShowStatus(const Arguments &arguments, Output &output) {
    if (arguments.Has("PATH") && arguments.Has("--share")) {
        throw Failure(ExitStatus::kUsage, "give a path or --share, not both");
    }
    const unsigned long interval = Interval(arguments);
    if (arguments.Has("--watch")) {
        Watch(arguments, interval, output);
        return ExitStatus::kDone;
    }
    const StatusReport report = ReportOf(arguments);
    output.Data() = report.data;
    for (const auto &line : report.Lines(output.Width())) {
        output.Line(line);
    }
    return report.gaps.Report(output);
}

}  // namespace VORK::FILEINDEXCTL
