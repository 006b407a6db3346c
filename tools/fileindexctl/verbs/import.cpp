#include "command_line/handlers.h"
#include "facts/registrations.h"
#include "facts/whole_file.h"
#include "report/confirm.h"
#include "report/failure.h"
#include "report/schedule.h"
#include "verbs/import_plan.h"

#include <fileindex/status.h>
#include <fileindex/status_mgr.h>

#include <functional>
#include <set>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::Status;
using VORK::FILEINDEX::StatusMgr;

constexpr std::size_t kMostFolders = 1000;

// Parts of the change, one after the other; what fails keeps the rest from being reached.
class Sequence {
public:
    void Do(const std::string &name, const std::function<StepReport()> &part) {
        if (stopped_) {
            report_.Add(name, StepResult::kNotReached);
            return;
        }
        try {
            report_.Append(part());
        } catch (const Failure &failure) {
            if (!report_.Has(StepResult::kDone)) {
                throw;
            }
            report_.Add(name, StepResult::kFailed, failure.what());
        }
        stopped_ = report_.Has(StepResult::kFailed);
    }

    const StepReport &Report() const { return report_; }

private:
    StepReport report_;
    bool stopped_ = false;
};

StepReport Apply(const FlagChange &flag, Patience &patience) {
    std::vector<PlannedStep> plan = {SaveStep(flag.member + " " + flag.Text())};
    if (flag.member == "no_space" && flag.value) {
        plan.push_back(
            {"administrators told", "the administrators could not be notified", {}, {{records::kNotifyNoSpace}}});
        return StepReport::Perform(plan, Status(), patience,
                                   [&] { return StatusMgr::ShareSetNoSpace(flag.name, true); });
    }
    if (flag.member == "no_space") {
        plan.push_back({"daemon told", "fileindexd cannot be reached", {{records::kReviveSend}}});
        return StepReport::Perform(plan, Status(), patience, [&] { return StatusMgr::ShareRevive(flag.name); });
    }
    return StepReport::Perform(plan, Status(), patience, [&] {
        return flag.member == "need_reindex" ? StatusMgr::ShareSetNeedReindex(flag.name, flag.value)
                                             : StatusMgr::SetUpdated(flag.name);
    });
}

// Both lists together may be more than can be stored.
bool RemovesFirst(const ImportPlan &plan) {
    return ReadFolders().size() + plan.folders.size() > kMostFolders;
}

// Folders first: the first of them starts the daemon, which then can be told of the rest. They are added before
// others are removed, so that the daemon is not stopped on the way from one list to another.
StepReport Apply(const ImportPlan &plan, Patience patience) {
    Json::Value records(Json::arrayValue);
    for (const auto &change : plan.folders) {
        records.append(change.to);
    }
    Sequence sequence;
    const auto upsert = [&] {
        if (!records.empty()) {
            sequence.Do("saved", [&] { return PerformUpsert(records, patience); });
        }
    };
    const auto remove = [&] {
        if (!plan.removal.All().empty()) {
            std::vector<std::string> removed;
            sequence.Do("removal saved",
                        [&] { return PerformRemoval("removal saved", plan.removal, removed, patience); });
        }
    };
    const bool removesFirst = RemovesFirst(plan);
    removesFirst ? remove() : upsert();
    removesFirst ? upsert() : remove();
    if (plan.pause) {
        sequence.Do("pause saved", [&] { return SetPause(*plan.pause, "pause saved", patience); });
    }
    for (const auto &flag : plan.flags) {
        sequence.Do(flag.member + " " + flag.Text(), [&] { return Apply(flag, patience); });
    }
    return sequence.Report();
}

std::string RestartOf(const ImportPlan &plan) {
    const std::size_t removed = plan.removal.All().size();
    const bool leavesNone = removed > 0 && removed == ReadFolders().size();
    return RestartWith(!plan.folders.empty(), leavesNone && (plan.folders.empty() || RemovesFirst(plan)));
}

void AskForRemoval(const Arguments &arguments, const ImportPlan &plan) {
    if (plan.removal.All().empty()) {
        return;
    }
    Folders folders = ReadFolders();
    if (!RemovesFirst(plan)) {
        for (const auto &change : plan.folders) {
            VORK::FILEINDEX::Folder folder;
            folder.path = change.to["path"].asString();
            folders.push_back(folder);
        }
    }
    RequireConsent(arguments, ConsequenceOf(plan.removal, folders));
}

void StateConfiguration(Output &output) {
    const std::size_t total = ReadFolders().size();
    output.Data()["total"] = static_cast<Json::UInt64>(total);
    output.Line(std::to_string(total) + (total == 1 ? " folder is indexed" : " folders are indexed"));
    long long resumeTime = -1;
    if (StatusMgr::GetPauseInfo(resumeTime)) {
        output.Line(PauseText(resumeTime));
    } else {
        output.Warn("whether indexing is paused cannot be told; \"fileindexctl doctor\" says why");
    }
}

}  // namespace

ExitStatus ImportConfiguration(const Arguments &arguments, Output &output) {
    const Patience patience(arguments);
    const std::string file = arguments.One("FILE");
    const std::string source = file == "-" ? "standard input" : file;
    const Configuration wanted = ParseConfiguration(ReadWhole(file), source);
    const ImportPlan plan = PlanImport(wanted, source, arguments.Has("--replace"));
    const bool dryRun = arguments.Has("--dry-run");
    output.Data()["dry_run"] = dryRun;
    plan.Show(output);
    if (plan.IsEmpty()) {
        output.Note("nothing is to be changed");
        return ExitStatus::kDone;
    }
    output.Flush();
    const std::string restart = RestartOf(plan);
    if (dryRun) {
        AnnounceRestart(restart, output);
        output.Note("nothing was done");
        return ExitStatus::kDone;
    }
    AskForRemoval(arguments, plan);
    std::set<std::string> touched;
    for (const auto &change : plan.folders) {
        touched.insert(ShareOf(change.to["path"].asString()));
    }
    WarnOfResumption(touched, SharesOf(ReadFolders()), output);
    AnnounceRestart(restart, output);
    const StepReport report = Apply(plan, patience);
    report.Show(output);
    StateConfiguration(output);
    if (report.Status() != ExitStatus::kDone) {
        output.Error(report.Status(),
                     "not everything is done, or not everybody knows; once the cause is mended, "
                     "repeat the command, then \"fileindexctl migrate\" tells everybody again");
    }
    return report.Status();
}

}  // namespace VORK::FILEINDEXCTL
