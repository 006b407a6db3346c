#include "verbs/folder_operations.h"

#include "facts/rules.h"
#include "facts/system_services.h"

#include <fileindex/indexability.h>

#include <vork/filesystem.h>
#include <vork/search.h>

#include <sys/stat.h>

#include <cerrno>

namespace VORK::FILEINDEXCTL {

namespace {

PlannedStep SearchStep(const Mark &mark, const Mark &other) {
    return {"search setting", "the search setting did not take effect", {}, {mark, other}};
}

PlannedStep DaemonStep(const Mark &mark) {
    return {"daemon told", "fileindexd cannot be reached", {mark}};
}

PlannedStep QueueStep(const std::vector<Mark> &fatal, const Paths &paths) {
    return {"events queued", "the event could not be queued", fatal, {}, Evidence::kRecord, SharesOf(paths)};
}

std::vector<PlannedStep> RemovalPlan(const std::string &saved, const Paths &removed, const Paths &rest) {
    std::vector<PlannedStep> plan = {SaveStep(saved), DaemonStep({records::kDeleteSend}),
                                     QueueStep({{records::kDeleteEvent}}, removed)};
    if (rest.empty()) {
        plan = StopPlan(saved, {records::kDeleteStop}, {records::kDeleteSearch}, {records::kDeleteRestart});
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

StepReport Remove(const std::string &saved, const Paths &removed, Patience &patience) {
    const auto plan = RemovalPlan(saved, removed, Without(ReadFolders(), removed));
    return PerformPlan(plan, false, patience, [&] { return IndexMgr::Delete(ToArray(removed)); });
}

}  // namespace

std::optional<Failure> WhyNoFolder(const std::string &fullPath) {
    if (const auto found = FirstUnreachable(fullPath)) {
        if (found->error == ENAMETOOLONG) {
            return Failure(ExitStatus::kUsage, Quoted(found->part) + " is longer than a name or a path can be");
        }
        if (found->error != ENOENT && found->error != ENOTDIR) {
            return std::nullopt;
        }
        const std::string &part = found->part;
        const bool isPattern = part.find_first_of("*?[", part.rfind('/')) != std::string::npos;
        return Failure(isPattern ? ExitStatus::kUsage : ExitStatus::kNoSuchFolder,
                       "there is no " + Quoted(part) +
                           (isPattern ? ", and patterns are not looked up: name the folders one by one" : ""));
    }
    struct stat status {};
    const int type = VORKGetFSType(fullPath.c_str(), 0);  // a dead server is not asked what is there
    if (VORKFSIsRemoteFS(type) == 0 && stat(fullPath.c_str(), &status) == 0 && !S_ISDIR(status.st_mode)) {
        return Failure(ExitStatus::kUsage, Quoted(fullPath) + " is a file; folders are indexed");
    }
    return std::nullopt;
}

void WarnOfObstacle(const std::string &path, const std::string &fullPath, Output &output) {
    if (const auto trouble = WhyNoFolder(fullPath)) {
        output.Warn(Quoted(path) + " cannot be indexed at present: " + trouble->what());
    } else if (!FILEINDEX::CanPathBeIndexed(path)) {
        output.Warn(Quoted(path) + " cannot be indexed at present; \"fileindexctl explain " + ShellWord(path) +
                    "\" says why");
    } else if (const auto obstacle = ObstacleTo(fullPath, RequireShare(ShareOf(path))); !obstacle.empty()) {
        output.Warn(Quoted(path) + " is not indexed: " + obstacle);
    }
}

std::string RestartWith(bool savesFolders, bool leavesNone) {
    const bool isOn = VORKSMBIsEnableSpotlight() != 0;
    const bool isSwitched = isOn ? leavesNone : savesFolders;
    if (!isSwitched || !IsFileSharingThere()) {
        return "";
    }
    return std::string("the file-sharing service will be restarted, because ") +
           (isOn ? "no folder is left and search is switched off" : "search is switched on");
}

void AnnounceRestart(const std::string &restart, Output &output) {
    if (!restart.empty()) {
        output.Note(restart);
    }
}

void StateTotal(std::size_t total, Output &output) {
    output.Data()["total"] = ToNumber(total);
    output.Line(std::to_string(total) + (total == 1 ? " folder is indexed" : " folders are indexed"));
}

StepReport PerformPlan(const std::vector<PlannedStep> &plan, bool switchesSearchOn, Patience &patience,
                       const std::function<bool()> &call) {
    const bool searchWasOn = VORKSMBIsEnableSpotlight() != 0;
    StepReport report = StepReport::Perform(plan, FILEINDEX::Folders(), patience, call);
    if (searchWasOn == switchesSearchOn) {
        report.Correct("search setting", StepResult::kAlready);
    }
    MarkDroppedEvents(report);
    return report;
}

StepReport PerformUpsert(const Json::Value &records, Patience &patience) {
    const std::vector<PlannedStep> plan = {
        SaveStep(),
        {"monitor", "the file-change monitor could not be registered", {{records::kUpsertMonitor}}},
        {"service", "fileindexd could not be started", {{records::kUpsertStart}}},
        SearchStep({records::kUpsertSearch}, {records::kUpsertRestart}),
        DaemonStep({records::kUpsertSend}),
        QueueStep({{records::kUpsertPath}, {records::kUpsertEvent}}, PathsOf(records)),
    };
    return PerformPlan(plan, true, patience, [&] { return IndexMgr::Upsert(records); });
}

std::vector<PlannedStep> StopPlan(const std::string &saved, const Mark &stop, const Mark &search,
                                  const Mark &restart) {
    return {
        SaveStep(saved), {"service", "fileindexd could not be stopped", {}, {stop}}, SearchStep(search, restart)};
}

Paths::iterator FirstAway(Paths &paths) {
    return std::stable_partition(paths.begin(), paths.end(),
                                 [](const std::string &path) { return IsSharePresent(ShareOf(path)); });
}

Paths Without(const Folders &folders, const Paths &removed) {
    Paths rest;
    for (const auto &folder : folders) {
        if (std::find(removed.begin(), removed.end(), folder.path) == removed.end()) {
            rest.push_back(folder.path);
        }
    }
    return rest;
}

std::string ConsequenceOf(const Paths &removed, const Folders &folders) {
    const Paths rest = Without(folders, removed);
    const std::set<std::string> left = SharesOf(rest);
    Paths emptied;
    for (const auto &share : SharesOf(removed)) {
        if (left.count(share) == 0 && IsSharePresent(share)) {
            emptied.push_back(share);
        }
    }
    std::string consequence = "this removes " + Enumerate(removed) + " from the index";
    if (!emptied.empty()) {
        consequence += std::string(" and deletes the index data of the share") +
                       (emptied.size() == 1 ? " " : "s ") + Enumerate(emptied);
    }
    const std::string restart = RestartWith(false, rest.empty());
    return consequence + (restart.empty() ? "" : "; ") + restart;
}

// Two requests: the library stops at the first folder whose share is away, and must not leave the others undone.
StepReport PerformRemoval(const std::string &saved, Paths &paths, Patience &patience) {
    const auto firstAway = FirstAway(paths);
    const Paths away(firstAway, paths.end());
    paths.erase(firstAway, paths.end());
    StepReport report;
    if (!paths.empty()) {
        report = Remove(saved, paths, patience);
    }
    if (!away.empty() && report.Status() == ExitStatus::kDone) {
        StepReport last = Remove(saved + " (share away)", away, patience);
        last.Excuse("the share is away");
        report.Append(last);
        paths.insert(paths.end(), away.begin(), away.end());
    }
    return report;
}

}  // namespace VORK::FILEINDEXCTL
