#include "report/steps.h"

#include "facts/platform_error.h"
#include "facts/queue_files.h"
#include "facts/registrations.h"
#include "facts/system_services.h"
#include "report/failure.h"
#include "report/text.h"

#include <fileindex/error.h>

#include <algorithm>
#include <string_view>

namespace VORK::FILEINDEXCTL {

namespace {

const std::string *FirstOf(const std::vector<Mark> &marks) {
    for (const auto &mark : marks) {
        if (const std::string *message = Records().Find(mark)) {
            return message;
        }
    }
    return nullptr;
}

// What the platform kept of the file-change monitor's registrations is the usual reason.
std::string TroubleWithRegistrations() {
    try {
        ReadRegistrations();
    } catch (const Failure &failure) {
        return failure.Status() == ExitStatus::kMalformed
                   ? failure.what() + std::string("; \"fileindexctl doctor --fix\" mends it")
                   : failure.what();
    }
    return {};
}

std::string TroubleWithQueues(const std::set<std::string> &shares) {
    for (const auto &share : shares) {
        std::string trouble = TroubleWithQueue(share);
        if (!trouble.empty()) {
            return trouble;
        }
    }
    return {};
}

// The command that shows what a service that failed has said itself.
std::string WhereToLook(const std::string &record, const std::string &cause) {
    const bool ran = record.find("VLIBService") != std::string::npos &&
                     record.find("err=[0x1500") == std::string::npos;  // there is no such service
    if (!ran || cause.find('"') != std::string::npos) {                // a command is named already
        return {};
    }
    const bool fileSharing = record.find("VLIBServiceRestart") != std::string::npos;  // nothing else is restarted
    if (RunsSystemd()) {
        return std::string("; see: journalctl -n 20 -u ") + (fileSharing ? "'smb*'" : "fileindexd");
    }
    return std::string("; see: service ") + (fileSharing ? "smbd" : "fileindexd") + " status";
}

// A record ends with the share or path that it is about.
std::string SubjectOf(const std::string &record) {
    for (const std::string_view mark : {", share=", ", path="}) {
        const auto found = record.find(mark);
        if (found != std::string::npos) {
            return " (" + record.substr(found + mark.size()) + ")";
        }
    }
    return {};
}

std::string Explain(const PlannedStep &step, const std::string *record) {
    std::string cause = TroubleWithQueues(step.shares);
    if (record == nullptr) {
        return step.trouble + (cause.empty() ? "" : ": " + cause);
    }
    cause = step.name.starts_with("monitor") ? TroubleWithRegistrations() : cause;
    cause = cause.empty() ? PlatformErrorOf(*record) : cause;
    return step.trouble + SubjectOf(*record) + (cause.empty() ? "" : ": " + cause) + WhereToLook(*record, cause);
}

struct Wording {
    StepResult result;
    const char *forPeople;
    const char *forPrograms;
    Colour colour;
};

const Wording &WordingOf(StepResult result) {
    static constexpr Wording kWordings[] = {
        {StepResult::kDone, "done", "done", Colour::kGood},
        {StepResult::kAlready, "as before", "unchanged", Colour::kDim},
        {StepResult::kFailed, "FAILED", "failed", Colour::kBad},
        {StepResult::kWentOn, "FAILED", "failed", Colour::kBad},
        {StepResult::kNotReached, "not reached", "not_reached", Colour::kBad},
        {StepResult::kSkipped, "skipped", "skipped", Colour::kDim},
    };
    return *std::ranges::find(kWordings, result, &Wording::result);
}

}  // namespace

PlannedStep SaveStep(const std::string &name) {
    return {name, "the configuration could not be saved", {}, {}, Evidence::kErrorCode};
}

StepReport StepReport::Trace(const std::vector<PlannedStep> &plan, bool succeeded) {
    StepReport report;
    const bool marked = std::any_of(plan.begin(), plan.end(),
                                    [](const PlannedStep &step) { return FirstOf(step.fatal) != nullptr; });
    bool stopped = false;
    for (const auto &step : plan) {
        const std::string *fatal = FirstOf(step.fatal);
        const std::string *tolerated = FirstOf(step.tolerated);
        if (stopped) {
            report.Add(step.name, StepResult::kNotReached);
        } else if (!succeeded && (fatal != nullptr || (!marked && step.evidence != Evidence::kRecord))) {
            report.Add(step.name, StepResult::kFailed, Explain(step, fatal), fatal == nullptr ? "" : *fatal);
            stopped = true;
        } else if (tolerated != nullptr) {
            report.Add(step.name, StepResult::kWentOn, Explain(step, tolerated), *tolerated);
        } else {
            report.Add(step.name, StepResult::kDone);
        }
    }
    return report;
}

StepReport StepReport::Perform(const std::vector<PlannedStep> &plan, const VORK::FILEINDEX::Config &config,
                               const std::function<bool()> &call) {
    ForgetErrors();
    const bool succeeded = call();
    StepReport report = Trace(plan, succeeded);
    const bool firstFailed = !report.steps_.empty() && report.steps_.front().result == StepResult::kFailed;
    const bool coded = VORK::FILEINDEX::ErrorHandler::GetError() != VORK::FILEINDEX::FILEINDEX_ERR_NONE;
    if (firstFailed && (coded || plan.front().evidence == Evidence::kErrorCode)) {
        throw FailureOf(config);
    }
    return report;
}

StepReport StepReport::Perform(const std::vector<PlannedStep> &plan, const VORK::FILEINDEX::Config &config,
                               Patience &patience, const std::function<bool()> &call) {
    RequireMayChange();
    for (;;) {
        try {
            return Perform(plan, config, call);
        } catch (const Failure &failure) {
            if (failure.Status() != ExitStatus::kBusy || !patience.Again()) {
                throw;
            }
        }
    }
}

void MarkDroppedEvents(StepReport &report) {
    if (Records().Find({records::kEventDropped}) != nullptr) {
        report.Correct("events queued", StepResult::kFailed, "the queue stayed locked, and the event was dropped");
    }
    if (Records().Find({records::kEventCut}) != nullptr) {
        report.Correct("events queued", StepResult::kFailed, "the event could not be written whole");
    }
}

void StepReport::Add(const std::string &name, StepResult result, const std::string &detail,
                     const std::string &record) {
    steps_.push_back({name, result, detail, record});
}

void StepReport::Add(const std::string &name, bool done, const std::string &trouble) {
    Add(name, done ? StepResult::kDone : StepResult::kFailed, done ? "" : trouble);
}

void StepReport::Correct(const std::string &name, StepResult result, const std::string &detail) {
    for (auto &step : steps_) {
        if (step.name == name && step.result == StepResult::kDone) {
            step.result = result;
            step.detail = detail;
        }
    }
}

void StepReport::Excuse(const std::string &reason) {
    for (auto &step : steps_) {
        if (step.result == StepResult::kFailed || step.result == StepResult::kNotReached) {
            step.result = StepResult::kSkipped;
            step.detail = reason;
        }
    }
}

void StepReport::Append(const StepReport &more) {
    steps_.insert(steps_.end(), more.steps_.begin(), more.steps_.end());
}

bool StepReport::Has(StepResult result) const {
    return std::any_of(steps_.begin(), steps_.end(), [&](const Step &step) { return step.result == result; });
}

ExitStatus StepReport::Status() const {
    if (!Has(StepResult::kFailed)) {
        return ExitStatus::kDone;
    }
    return Has(StepResult::kDone) ? ExitStatus::kPartly : ExitStatus::kUnreachable;
}

// Fills "steps", and gives the lines.
std::vector<std::string> StepReport::Tell(Output &output) const {
    std::vector<std::vector<std::string>> rows;
    auto &list = output.Data()["steps"];
    for (const auto &step : steps_) {
        const Wording &wording = WordingOf(step.result);
        rows.push_back({step.name, wording.forPeople + (step.detail.empty() ? "" : ": " + step.detail)});
        Json::Value entry(Json::objectValue);
        entry["step"] = step.name;
        entry["result"] = wording.forPrograms;
        entry["detail"] = step.detail;
        if (!step.record.empty()) {
            entry["record"] = step.record;
        }
        list.append(entry);
    }
    return Align(rows, 0);
}

void StepReport::Note(Output &output) const {
    for (const auto &line : Tell(output)) {
        output.Note(line);
    }
}

void StepReport::Show(Output &output) const {
    const auto lines = Tell(output);
    for (std::size_t i = 0; i < lines.size(); ++i) {
        output.Line(lines[i], WordingOf(steps_[i].result).colour);
    }
    for (const auto &step : steps_) {
        if (step.result == StepResult::kWentOn) {
            output.Warn(step.detail);
        }
    }
}

}  // namespace VORK::FILEINDEXCTL
