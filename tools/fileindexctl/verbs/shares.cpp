// "share": the life of a share as a whole.
#include "facts/config_lock.h"
#include "facts/daemon.h"
#include "facts/queue_files.h"
#include "facts/registrations.h"
#include "report/confirm.h"
#include "verbs/folder_operations.h"

#include <fileindex/paths.h>

#include <vorknotifyd/monitor_queue.h>

#include <sys/stat.h>

namespace VORK::FILEINDEXCTL {

namespace {

Paths PathsOf(const std::string &share, const Folders &folders) {
    Paths paths;
    for (const auto &folder : folders) {
        if (ShareOf(folder.path) == share) {
            paths.push_back(folder.path);
        }
    }
    return paths;
}

Paths RequireIndexed(const std::string &share, const Folders &folders) {
    auto paths = PathsOf(share, folders);
    if (paths.empty()) {
        throw Failure(ExitStatus::kNoSuchFolder, "no folder of the share \"" + share + "\" is indexed");
    }
    return paths;
}

bool IsWatched(const std::string &share) try {
    return ReadRegistrations().count(QueuePathOf(share)) > 0;
} catch (const Failure &) {
    return false;  // nobody can read the file, the monitor neither
}

void StateShare(const std::string &share, Output &output) {
    const auto paths = PathsOf(share, ReadFolders());
    const bool isWatched = IsWatched(share);
    output.Data()["folders"] = ToArray(paths);
    output.Data()["watched"] = isWatched;
    output.Line("share " + share + ": " + (paths.empty() ? "no folder is indexed" : Enumerate(paths)) +
                (isWatched ? ", watched for changes" : ", not watched for changes"));
}

// Folders that both names have keep the settings of the old one only.
void AskForOverwriting(const Arguments &arguments, const Paths &paths, const Folders &folders, Output &output) {
    Paths overwritten;
    for (const auto &path : paths) {
        const std::string target = FILEINDEX::ReplaceShareName(path, arguments.One("NEW"));
        if (FindFolder(target, folders) != nullptr) {
            overwritten.push_back(target);
        }
    }
    output.Data()["overwritten"] = ToArray(overwritten);
    if (!overwritten.empty()) {
        RequireConsent(arguments, "this overwrites the settings of " + Enumerate(overwritten) +
                                      " with those of the share " + Quoted(arguments.One("OLD")));
    }
}

// The registration is kept under the queue's path, which a share that is gone cannot be asked for any more. A
// renamed directory has stayed where it was, so the former path stands beside the new one.
std::string FormerQueue(const std::string &oldShare, const std::string &newShare) {
    if (IsSharePresent(oldShare)) {
        return QueuePathOf(oldShare);
    }
    const std::string directory = RequireShare(newShare);
    return directory.substr(0, directory.rfind('/') + 1) + oldShare +
           QueuePathOf(newShare).substr(directory.size());
}

bool WasPaused(const std::string &formerQueue, const std::string &newShare) try {
    return IsQueuePaused(formerQueue) && IsQueuePaused(QueuePathOf(newShare));
} catch (const Failure &) {
    return false;  // the step that registers says what is wrong with the file
}

// The library leaves the monitor as it was.
void RefreshMonitor(const std::string &oldShare, const std::string &newShare, Patience &patience,
                    StepReport &report) {
    FILEINDEX::Folders store;
    ForgetErrors();
    const ConfigLock lock(store, patience);  // so that no newer registration is replaced by an older one
    const std::string step = "monitor of " + newShare;
    if (!lock.IsHeld()) {
        report.Add(step, StepResult::kFailed, "folder.conf is locked by another program");
        return;
    }
    const std::string former = FormerQueue(oldShare, newShare);
    if (WasPaused(former, newShare)) {
        report.Add(step, StepResult::kSkipped, "the share is paused");
        return;
    }
    report.Add(step, IndexMgr::UpsertVorkNotifydCfg(newShare), "it could not be registered");
    report.Add("monitor of " + oldShare,
               VORKNOTIFYD::MonitorQueue::Delete(former, kRegistration, VORKNOTIFYD::MONITOR_QUEUE_TYPE_FILE),
               "it could not be withdrawn");
}

// Both ask the daemon and the monitor, whose registrations are the platform's.
ExitStatus SetAtWork(const std::string &share, const std::vector<PlannedStep> &plan, const char *wanted,
                     bool (*call)(const std::string &), bool (*isDenied)(), Output &output) {
    RequireShare(share);
    const StepReport report = StepReport::Perform(plan, FILEINDEX::Folders(), [&] { return call(share); });
    report.Show(output);
    StateShare(share, output);
    const bool forLackOfPermission = isDenied() && report.Status() == ExitStatus::kUnreachable;
    return output.Conclude(
        forLackOfPermission ? ExitStatus::kPermission : report.Status(),
        "the share \"" + share + "\" is not wholly " + wanted + "; once the cause is mended, repeat the command");
}

void RequireNoLink(const std::string &directory) {
    struct stat status {};
    if (lstat(directory.c_str(), &status) == 0 && S_ISLNK(status.st_mode)) {
        throw Failure(ExitStatus::kCannotSave,
                      directory + " is a symbolic link, and nothing is deleted through it; remove the link");
    }
}

bool Exists(const std::string &path) {
    struct stat status {};
    return lstat(path.c_str(), &status) == 0;
}

}  // namespace

ExitStatus RenameShare(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const std::string oldShare = arguments.One("OLD");
    const std::string newShare = arguments.One("NEW");
    const Folders folders = ReadFolders();
    const auto paths = RequireIndexed(oldShare, folders);
    RequireShare(newShare);
    if (oldShare == newShare) {
        throw Failure(ExitStatus::kUsage, "both names are \"" + newShare + "\"");
    }
    AskForOverwriting(arguments, paths, folders, output);
    StepReport report = StepReport::Perform({SaveStep()}, FILEINDEX::Folders(), patience,
                                            [&] { return IndexMgr::ShareRename(oldShare, newShare); });
    RefreshMonitor(oldShare, newShare, patience, report);
    report.Show(output);
    StateShare(newShare, output);
    return output.Conclude(report.Status(),
                           "the folders are moved, but the monitor is not in step; \"fileindexctl share resume " +
                               ShellWord(newShare) + "\" registers it");
}

ExitStatus RemoveShare(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const std::string share = arguments.One("SHARE");
    const Folders folders = ReadFolders();
    const auto paths = RequireIndexed(share, folders);
    const bool leavesNone = paths.size() == folders.size();
    const std::string restart = RestartWith(false, leavesNone);
    RequireConsent(arguments, "this removes " + Enumerate(paths) + " from the index" +
                                  (restart.empty() ? "" : "; ") + restart);
    AnnounceRestart(restart, output);
    std::vector<PlannedStep> plan = {SaveStep()};
    if (leavesNone) {
        plan = StopPlan("saved", {records::kShareRemoveStop}, {records::kShareRemoveSearch},
                        {records::kShareRemoveRestart});
    }
    const StepReport report = PerformPlan(plan, false, patience, [&] { return IndexMgr::ShareRemove(share); });
    report.Show(output);
    StateShare(share, output);
    if (IsSharePresent(share)) {
        output.Warn("the share \"" + share +
                    "\" keeps its monitor (\"fileindexctl share pause\" withdraws it) and its "
                    "index data (\"fileindexctl share clean\" deletes it)");
    }
    return report.Status();
}

ExitStatus PauseShare(const Arguments &arguments, Output &output) {
    return SetAtWork(
        arguments.One("SHARE"),
        {{"worker stopped", "fileindexd cannot be reached", {}, {}, Evidence::kNone},
         {"monitor", "it could not be withdrawn", {{records::kSharePauseWithdraw}}}},
        "at rest", IndexMgr::SharePause, [] { return ProbeDaemon().condition == DaemonCondition::kDenied; },
        output);
}

ExitStatus ResumeShare(const Arguments &arguments, Output &output) {
    return SetAtWork(
        arguments.One("SHARE"),
        {{"monitor", "it could not be registered", {{records::kShareResumeMonitor}}},
         {"worker started", "fileindexd cannot be reached", {}, {}, Evidence::kNone}},
        "at work", IndexMgr::ShareResume, [] { return MayNotWrite(kRegistrationsFile); }, output);
}

ExitStatus CleanShare(const Arguments &arguments, Output &output) {
    const std::string share = arguments.One("SHARE");
    RequireShare(share);
    const std::string queue = QueuePathOf(share);
    const std::string directory = queue.substr(0, queue.rfind('/'));
    RequireNoLink(directory);
    if (IndexMgr::IsShareIndexed(share)) {
        output.Warn("folders of the share \"" + share +
                    "\" are indexed; pause the share before, reindex them after");
    }
    RequireConsent(arguments,
                   "this deletes the event queue and the index database of the share \"" + share + "\"");

    const std::pair<const char *, std::string> files[] = {
        {"queue", queue}, {"queue .tmp", queue + ".tmp"}, {"database", directory + "/VORK@.fileindexdb"}};
    StepReport report;
    for (const auto &[name, path] : files) {
        report.Add(name, Exists(path) ? StepResult::kDone : StepResult::kAlready);
    }
    ForgetErrors();
    IndexMgr::CleanShareIndexData(share);
    // The library does not look at what the deleting came to, so this does.
    for (const auto &[name, path] : files) {
        if (Exists(path)) {
            report.Correct(name, StepResult::kFailed, path + " is still there");
        }
    }
    report.Show(output);
    if (!report.Has(StepResult::kFailed)) {
        output.Line("share " + share + ": no index data");
        return ExitStatus::kDone;
    }
    const ExitStatus none = MayNotWrite(queue) ? ExitStatus::kPermission : ExitStatus::kCannotSave;
    return output.Conclude(report.Has(StepResult::kDone) ? ExitStatus::kPartly : none,
                           "not everything could be deleted");
}

}  // namespace VORK::FILEINDEXCTL
