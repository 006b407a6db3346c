#include "command_line/handlers.h"
#include "facts/config_lock.h"
#include "facts/paths.h"
#include "facts/queue_files.h"
#include "facts/records.h"
#include "facts/registrations.h"
#include "report/failure.h"
#include "report/steps.h"
#include "report/text.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>

#include <vorknotifyd/monitor_queue.h>

#include <algorithm>
#include <filesystem>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::IndexMgr;

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
    const auto shares = SharesOf(folders);
    const auto paused = PausedShares(shares);
    for (const auto &share : shares) {
        const std::string path = QueuePathOf(share);
        queues[path.empty() ? share : path] = {share, {}, {}, path.empty(), paused.count(share) > 0};
    }
    for (const auto &folder : folders) {
        const std::string path = QueuePathOf(ShareOf(folder.path));
        if (!path.empty()) {
            queues[path].expected.insert(ExpectedWatch(folder.GetFullPath()));
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

struct Row {
    std::string path;
    const char *state;
};

std::vector<Row> Compare(const Queue &queue) {
    std::vector<Row> rows;
    for (const auto &[path, how] : queue.expected) {
        const auto found = queue.registered.find(path);
        rows.push_back({path, queue.isPaused                    ? "paused"
                              : found == queue.registered.end() ? "missing"
                              : found->second == how            ? "watched"
                                                                : "different"});
    }
    for (const auto &[path, how] : queue.registered) {
        if (queue.expected.find(path) == queue.expected.end()) {
            rows.push_back({path, queue.isAway ? "share away" : "not indexed"});
        }
    }
    return rows;
}

void Add(const Queue &queue, const std::string &path, std::vector<std::vector<std::string>> &rows,
         Output &output) {
    Json::Value entry(Json::objectValue);
    entry["share"] = queue.share;
    entry["queue"] = queue.isAway ? Json::Value() : Json::Value(path);
    entry["in_step"] = queue.IsInStep() && !queue.isAway;
    entry["watch"] = Json::Value(Json::arrayValue);
    for (const auto &row : Compare(queue)) {
        rows.push_back({row.path, queue.share, row.state});
        Json::Value watch(Json::objectValue);
        watch["path"] = row.path;
        watch["state"] = row.state;
        entry["watch"].append(watch);
    }
    output.Data()["monitor"].append(entry);
}

void RequireKnown(const Arguments &arguments, const Queues &queues) {
    if (arguments.Has("SHARE") && queues.empty()) {
        RequireShare(arguments.One("SHARE"));
    }
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

void State(const Queues &queues, std::vector<std::vector<std::string>> rows, Output &output) {
    output.Data()["monitor"] = Json::Value(Json::arrayValue);
    for (const auto &[path, queue] : queues) {
        if (queue.isAway) {
            output.Warn("the share \"" + queue.share + "\" is away, so its folders cannot be watched");
        }
        if (queue.isPaused) {
            output.Note(PausedText(queue.share));
        }
        Add(queue, path, rows, output);
    }
    if (rows.size() == 1) {
        output.Note("nothing is watched, and nothing should be");
        return;
    }
    for (const auto &line : Align(rows, output.Width())) {
        output.Line(line);
    }
}

}  // namespace

ExitStatus ShowMonitor(const Arguments &arguments, Output &output) {
    const Queues queues = ReadQueues(arguments.One("SHARE"));
    RequireKnown(arguments, queues);
    State(queues, {{"FULL PATH", "SHARE", "STATE"}}, output);
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
    VORK::FILEINDEX::Folders store;
    ForgetErrors();
    const ConfigLock lock(store, patience);  // so that no newer registration is replaced by an older one
    if (!lock.IsHeld()) {
        throw FailureOf(store);
    }
    const Queues queues = ReadQueues(arguments.One("SHARE"));
    RequireKnown(arguments, queues);
    StepReport report;
    for (const auto &[path, queue] : queues) {
        const std::string name = "monitor of " + queue.share;
        if (queue.isAway) {
            report.Add(name, StepResult::kSkipped, "the share is away");
            continue;
        }
        if (queue.isPaused && !arguments.Has("SHARE")) {
            report.Add(name, StepResult::kSkipped, "the share is paused");
            continue;
        }
        ForgetErrors();
        const bool done = Refresh(path, queue);
        report.Add(name,
                   !done              ? StepResult::kFailed
                   : queue.IsInStep() ? StepResult::kAlready
                                      : StepResult::kDone,
                   done ? "" : Records().Last());
    }
    report.Show(output);
    State(ReadQueues(arguments.One("SHARE")), {{"FULL PATH", "SHARE", "STATE"}}, output);
    if (report.Status() != ExitStatus::kDone) {
        output.Error(report.Status(),
                     "not everything is registered; once the cause is mended, repeat the command");
    }
    return report.Status();
}

}  // namespace VORK::FILEINDEXCTL
