// "migrate": everybody is told of everything again.
#include "facts/daemon.h"
#include "facts/queue.h"
#include "facts/queue_files.h"
#include "facts/registrations.h"
#include "report/confirm.h"
#include "report/steps.h"
#include "verbs/verb.h"

#include <fileindex/updater.h>

#include <vork/search.h>

namespace VORK::FILEINDEXCTL {

namespace {

std::vector<PlannedStep> Plan(const Folders &folders) {
    if (folders.empty()) {
        return {{"service", "fileindexd could not be stopped", {{records::kUpgradeStop}}, {}, Evidence::kNone}};
    }
    return {
        {"service", "fileindexd could not be started", {{records::kUpgradeStart}}, {}, Evidence::kNone},
        {"search setting", "the search setting could not be switched on", {{records::kUpgradeSearch}}},
        {"monitors",
         "a file-change monitor could not be registered",
         {{records::kUpgradeShare}, {records::kUpgradeMonitor}}},
        {"events queued",
         "the reindexing could not be queued",
         {{records::kUpgradeReindex}},
         {},
         Evidence::kRecord,
         SharesOf(folders)},
    };
}

// What holds afterwards, whatever the steps came to.
void StateEffect(const Folders &folders, Output &output) {
    std::set<std::string> waiting;
    for (const auto &share : SharesOf(folders)) {
        QueueFiles(QueuePathOf(share)).Visit([&](const QueueEvent *event) {
            if (event != nullptr && event->type == kReindexEvent) {
                waiting.emplace(event->path);
            }
        });
    }
    Paths queued;
    for (const auto &folder : folders) {
        if (waiting.count(folder.GetFullPath()) > 0) {
            queued.push_back(folder.path);
        }
    }
    const DaemonState daemon = ProbeDaemon();
    const bool search = VORKSMBIsEnableSpotlight() != 0;
    output.Data()["daemon"] = daemon.ForPrograms();
    output.Data()["search"] = search;
    output.Data()["queued"] = ToArray(queued);
    output.Facts({{"daemon", daemon.text},
                  {"search", search ? "on" : "off"},
                  {"queued to be reindexed", queued.empty() ? "none" : Enumerate(queued)}});
}

void StatePlan(const Folders &folders, const std::set<std::string> &paused, Output &output) {
    if (folders.empty()) {
        output.Line("no folder is indexed: fileindexd is to stand still");
        return;
    }
    output.Line("fileindexd is to run, with search switched on, and these to be indexed anew:");
    for (const auto &folder : folders) {
        output.Line("  " + folder.path);
    }
    const auto shares = SharesOf(folders);
    output.Line("watched for changes: " + Enumerate({shares.begin(), shares.end()}));
    for (const auto &share : paused) {
        output.Line(PausedText(share));
    }
}

void AskForResumption(const Arguments &arguments, const std::set<std::string> &paused) {
    if (paused.empty()) {
        return;
    }
    const bool several = paused.size() > 1;
    const std::string names = several ? "s " + Enumerate({paused.begin(), paused.end()}) + " are"
                                      : " " + Quoted(*paused.begin()) + " is";
    RequireConsent(arguments, "the share" + names + " paused (indexed, but not watched); this has " +
                                  (several ? "them" : "it") + " watched again");
}

}  // namespace

ExitStatus Migrate(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    output.Data()["dry_run"] = arguments.Has("--dry-run");
    output.Data()["folders"] = ToArray(folders, &Folder::path);
    const auto paused = PausedShares(SharesOf(folders));
    output.Data()["paused_shares"] = ToArray(paused);
    if (arguments.Has("--dry-run")) {
        StatePlan(folders, paused, output);
        output.Note("nothing was done");
        return ExitStatus::kDone;
    }
    AskForResumption(arguments, paused);
    RequireMayChange();
    StepReport report =
        StepReport::Perform(Plan(folders), FILEINDEX::Folders(), [] { return FILEINDEX::Updater_zol60_beta2(); });
    MarkDroppedEvents(report);
    for (const auto &share : paused) {
        const bool done = !report.Has(StepResult::kFailed) && IndexMgr::ShareResume(share);
        report.Add("worker of " + share, done, "the share could not be resumed");
    }
    report.Show(output);
    StateEffect(folders, output);
    return output.Conclude(report.Status(),
                           "this is not done whole; once the cause is mended, repeat the command");
}

}  // namespace VORK::FILEINDEXCTL
