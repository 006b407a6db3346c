// "monitor": what the notification daemon watches, and what it should.
#include "facts/config_lock.h"
#include "facts/queue_files.h"
#include "facts/records.h"
#include "facts/registrations.h"
#include "report/steps.h"
#include "verbs/verb.h"

#include <vorknotifyd/monitor_queue.h>

#include <filesystem>

namespace VORK::FILEINDEXCTL {

namespace {

// What is registered under one queue and what should be.
struct Queue {
    std::string share;
    Watches registered{};
    Watches expected{};
    bool isAway = false;  ///< folders are indexed, but nothing can be registered
    bool isPaused = false;

    bool IsInStep() const { return registered == expected; }
};

// By the path of the queue; for a share that is away, which has none, by its name.
using Queues = std::map<std::string, Queue>;

// A share that is away cannot be asked for its queue, but its directory bore its name.
std::string ShareOfQueue(const std::string &path) {
    const std::string share = ShareOfFullPath(path);
    const std::filesystem::path directory = std::filesystem::path(path).parent_path().parent_path();
    return share.empty() ? directory.filename().string() : share;
}

Queues ReadQueues(const std::string &only) {
    Queues queues;
    const Folders folders = ReadFolders();
    const auto paused = PausedShares(SharesOf(folders));
    for (const auto &folder : folders) {
        const std::string share = ShareOf(folder.path);
        const std::string path = QueuePathOf(share);
        const Queue empty{share, {}, {}, path.empty(), paused.count(share) > 0};
        Queue &queue = queues.try_emplace(path.empty() ? share : path, empty).first->second;
        if (!queue.isAway) {
            queue.expected.insert(ExpectedWatch(folder.GetFullPath()));
        }
    }
    for (const auto &[path, watches] : ReadRegistrations()) {
        const std::string share = ShareOfQueue(path);
        const auto away = queues.find(share);
        Queue &queue = away == queues.end() ? queues[path] : away->second;
        queue.share = share;
        queue.registered = watches;
    }
    if (!only.empty()) {
        std::erase_if(queues, [&](const auto &entry) { return entry.second.share != only; });
    }
    return queues;
}

// Those of the share that was asked for, or all.
Queues RequireQueues(const Arguments &arguments) {
    Queues queues = ReadQueues(arguments.One("SHARE"));
    if (arguments.Has("SHARE") && queues.empty()) {
        RequireShare(arguments.One("SHARE"));
    }
    return queues;
}

// For programs; a row of the table for each watch.
Json::Value WatchesOf(const Queue &queue, Rows &rows) {
    Json::Value watches(Json::arrayValue);
    const auto add = [&](const std::string &path, const char *state) {
        rows.push_back({path, queue.share, state});
        watches.append(ToObject({{"path", path}, {"state", state}}));
    };
    for (const auto &[path, how] : queue.expected) {
        const auto found = queue.registered.find(path);
        add(path, queue.isPaused                    ? "paused"
                  : found == queue.registered.end() ? "missing"
                  : found->second == how            ? "watched"
                                                    : "different");
    }
    for (const auto &[path, how] : queue.registered) {
        if (queue.expected.count(path) == 0) {
            add(path, queue.isAway ? "share away" : "not indexed");
        }
    }
    return watches;
}

// Without folders nothing is to be watched, and the registration is withdrawn; of a share that is gone, too.
bool Refresh(const std::string &path, const Queue &queue) {
    if (!queue.expected.empty()) {
        return IndexMgr::UpsertVorkNotifydCfg(queue.share);
    }
    if (QueuePathOf(queue.share) == path) {
        return IndexMgr::DeleteVorkNotifydCfg(queue.share);
    }
    return VORKNOTIFYD::MonitorQueue::Delete(path, kRegistration, VORKNOTIFYD::MONITOR_QUEUE_TYPE_FILE);
}

void RefreshOne(const std::string &path, const Queue &queue, bool isAskedFor, StepReport &report) {
    const std::string name = "monitor of " + queue.share;
    if (queue.isAway) {
        report.Add(name, StepResult::kSkipped, "the share is away");
        return;
    }
    if (queue.isPaused && !isAskedFor) {
        report.Add(name, StepResult::kSkipped, "the share is paused");
        return;
    }
    ForgetErrors();
    const bool done = Refresh(path, queue);
    report.Add(name, done, Records().Last());
    if (queue.IsInStep()) {
        report.Correct(name, StepResult::kAlready);
    }
}

void State(const Queues &queues, Output &output) {
    Rows rows = {{"FULL PATH", "SHARE", "STATE"}};
    auto &list = output.Data()["monitor"] = Json::Value(Json::arrayValue);
    for (const auto &[path, queue] : queues) {
        if (queue.isAway) {
            output.Warn("the share \"" + queue.share + "\" is away, so its folders cannot be watched");
        }
        if (queue.isPaused) {
            output.Note(PausedText(queue.share));
        }
        list.append(ToObject({{"share", queue.share},
                              {"queue", queue.isAway ? Json::Value() : Json::Value(path)},
                              {"in_step", queue.IsInStep() && !queue.isAway},
                              {"watch", WatchesOf(queue, rows)}}));
    }
    if (rows.size() == 1) {
        output.Note("nothing is watched, and nothing should be");
        return;
    }
    output.Table(rows);
}

}  // namespace

ExitStatus ShowMonitor(const Arguments &arguments, Output &output) {
    const Queues queues = RequireQueues(arguments);
    State(queues, output);
    const auto isInStep = [](const auto &entry) { return entry.second.IsInStep(); };
    const auto isAsWanted = [](const auto &entry) { return entry.second.IsInStep() || entry.second.isPaused; };
    output.Data()["in_step"] = std::all_of(queues.begin(), queues.end(), isInStep);
    if (!std::all_of(queues.begin(), queues.end(), isAsWanted)) {
        output.Note("\"fileindexctl monitor refresh\" mends the differences");
    }
    return ExitStatus::kDone;
}

ExitStatus RefreshMonitors(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    FILEINDEX::Folders store;
    ForgetErrors();
    const ConfigLock lock(store, patience);  // so that no newer registration is replaced by an older one
    if (!lock.IsHeld()) {
        throw FailureOf(store);
    }
    StepReport report;
    for (const auto &[path, queue] : RequireQueues(arguments)) {
        RefreshOne(path, queue, arguments.Has("SHARE"), report);
    }
    report.Show(output);
    State(ReadQueues(arguments.One("SHARE")), output);
    return output.Conclude(report.Status(),
                           "not everything is registered; once the cause is mended, repeat the command");
}

}  // namespace VORK::FILEINDEXCTL
