#include "command_line/handlers.h"
#include "facts/paths.h"
#include "facts/registrations.h"
#include "report/confirm.h"
#include "report/failure.h"
#include "report/steps.h"
#include "report/text.h"
#include "verbs/folder_operations.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>

#include <vork/search.h>

#include <algorithm>
#include <set>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::IndexMgr;

using Paths = std::vector<std::string>;

bool Contains(const Paths &paths, const std::string &path) {
    return std::find(paths.begin(), paths.end(), path) != paths.end();
}

std::set<std::string> SharesOf(const Paths &paths) {
    std::set<std::string> shares;
    for (const auto &path : paths) {
        shares.insert(ShareOf(path));
    }
    return shares;
}

Paths Without(const Folders &folders, const Paths &removed) {
    Paths rest;
    for (const auto &folder : folders) {
        if (!Contains(removed, folder.path)) {
            rest.push_back(folder.path);
        }
    }
    return rest;
}

Removal Requested(const Arguments &arguments, const Folders &folders, Output &output) {
    Removal removal;
    for (const auto &given : arguments.All("PATH")) {
        const std::string path = RequireFolder(given, folders).path;
        if (removal.Contains(path)) {
            output.Warn("\"" + path + "\" is given twice");
            continue;
        }
        removal.Add(path);
    }
    if (!removal.away.empty() && !arguments.Has("--force")) {
        throw Failure(ExitStatus::kUsage,
                      "the share of \"" + removal.away.front() +
                          "\" is away, so its monitor and its index data would be left behind; "
                          "--force removes the folder all the same");
    }
    return removal;
}

// The last folder of all stops the service; then nobody is told anything.
std::vector<PlannedStep> Plan(const std::string &saved, const Paths &removed, const Paths &rest) {
    std::vector<PlannedStep> plan = {SaveStep(saved)};
    if (rest.empty()) {
        plan.push_back({"service", "fileindexd could not be stopped", {}, {{records::kDeleteStop}}});
        plan.push_back({"search setting",
                        "the search setting did not take effect",
                        {},
                        {{records::kDeleteSearch}, {records::kDeleteRestart}}});
    } else {
        plan.push_back({"daemon told", "fileindexd cannot be reached", {{records::kDeleteSend}}});
        plan.push_back({"events queued",
                        "the event could not be queued",
                        {{records::kDeleteEvent}},
                        {},
                        Evidence::kRecord,
                        SharesOf(removed)});
    }
    const std::set<std::string> left = SharesOf(rest);
    for (const auto &share : SharesOf(removed)) {
        const std::string ending = "share=" + share;
        const std::string monitor = "monitor of " + share;
        if (left.count(share) > 0) {
            plan.push_back({monitor, "the monitor could not be registered", {{records::kDeleteMonitor, ending}}});
            continue;
        }
        plan.push_back({"index data of " + share, "it could not be deleted", {{records::kDeleteClean, ending}}});
        plan.push_back({monitor, "the monitor could not be withdrawn", {{records::kDeleteWithdraw, ending}}});
    }
    return plan;
}

StepReport Remove(const std::string &saved, const Paths &removed, const Folders &folders, Patience &patience) {
    Json::Value request(Json::arrayValue);
    for (const auto &path : removed) {
        request.append(path);
    }
    const bool searchWasOn = VORKSMBIsEnableSpotlight() != 0;
    StepReport report =
        StepReport::Perform(Plan(saved, removed, Without(folders, removed)), VORK::FILEINDEX::Folders(), patience,
                            [&] { return IndexMgr::Delete(request); });
    if (!searchWasOn) {
        report.Correct("search setting", StepResult::kAlready);
    }
    MarkDroppedEvents(report);
    return report;
}

void StateRest(const Paths &removed, Output &output) {
    Folders folders;
    IndexMgr::List(folders);
    auto &data = output.Data();
    data["removed"] = Json::Value(Json::arrayValue);
    for (const auto &path : removed) {
        const auto covering = Covering(Locate(path, folders), folders);
        if (!Contains(covering, path)) {
            data["removed"].append(path);
        }
        output.Line(
            Printable(path + (covering.empty() ? " is not indexed" : " still lies in " + Enumerate(covering))));
    }
    data["total"] = static_cast<Json::UInt64>(folders.size());
    output.Line(std::to_string(folders.size()) +
                (folders.size() == 1 ? " folder is indexed" : " folders are indexed"));
}

}  // namespace

bool Removal::Contains(const std::string &path) const {
    return FILEINDEXCTL::Contains(All(), path);
}

void Removal::Add(const std::string &path) {
    (IsSharePresent(ShareOf(path)) ? present : away).push_back(path);
}

Paths Removal::All() const {
    Paths all = present;
    all.insert(all.end(), away.begin(), away.end());
    return all;
}

std::string ConsequenceOf(const Removal &removal, const Folders &folders) {
    const Paths all = removal.All();
    std::string consequence = "this removes " + Enumerate(all) + " from the index";
    const std::set<std::string> left = SharesOf(Without(folders, all));
    Paths emptied;
    for (const auto &share : SharesOf(removal.present)) {
        if (left.count(share) == 0) {
            emptied.push_back(share);
        }
    }
    if (!emptied.empty()) {
        consequence += (emptied.size() == 1 ? " and deletes the index data of the share "
                                            : " and deletes the index data of the shares ") +
                       Enumerate(emptied);
    }
    const std::string restart = RestartWith(false, Without(folders, all).empty());
    return consequence + (restart.empty() ? "" : "; ") + restart;
}

// Two requests: the library stops at the first folder whose share is away, and must not leave the others undone.
StepReport PerformRemoval(const std::string &saved, const Removal &removal, Paths &removed, Patience &patience) {
    StepReport report;
    removed = removal.present;
    if (!removal.present.empty()) {
        report = Remove(saved, removal.present, ReadFolders(), patience);
    }
    if (!removal.away.empty() && report.Status() == ExitStatus::kDone) {
        StepReport away = Remove(saved + " (share away)", removal.away, ReadFolders(), patience);
        away.Excuse("the share is away");
        report.Append(away);
        removed = removal.All();
    }
    return report;
}

ExitStatus RemoveFolders(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const Folders folders = ReadFolders();
    const Removal removal = Requested(arguments, folders, output);
    RequireConsent(arguments, ConsequenceOf(removal, folders));
    WarnOfResumption(SharesOf(removal.present), SharesOf(Without(folders, removal.All())), output);
    AnnounceRestart(RestartWith(false, Without(folders, removal.All()).empty()), output);
    Paths removed;
    const StepReport report = PerformRemoval("saved", removal, removed, patience);
    report.Show(output);
    StateRest(removed, output);
    if (report.Status() != ExitStatus::kDone) {
        output.Error(report.Status(),
                     "the folders are removed, but not everybody knows; once the cause is mended: \"fileindexctl "
                     "monitor refresh\", and \"fileindexctl share clean\" for a share without folders");
    }
    return report.Status();
}

}  // namespace VORK::FILEINDEXCTL
