// "queue": what waits for the daemon.
#include "facts/queue.h"

#include "facts/queue_files.h"
#include "report/gaps.h"
#include "report/schedule.h"
#include "verbs/verb.h"

#include <limits>

namespace VORK::FILEINDEXCTL {

namespace {

// The share that was asked for, or all with folders.
std::set<std::string> Shares(const Arguments &arguments) {
    auto indexed = SharesOf(ReadFolders());
    if (!arguments.Has("SHARE")) {
        return indexed;
    }
    if (indexed.count(arguments.One("SHARE")) == 0) {
        RequireShare(arguments.One("SHARE"));
    }
    return {arguments.One("SHARE")};
}

std::string Padded(std::string name) {
    constexpr std::size_t kWidth = 8;
    name.resize(std::max(name.size(), kWidth), ' ');
    return name;
}

void ShowEvent(const std::string &share, const QueueEvent &event, QueueFiles &files, Output &output) {
    const std::string path(event.path);
    const std::string oldPath(event.oldPath);
    if (!output.IsJson()) {
        output.Line(share + "  " + Padded(EventName(event.type)) + "  " +
                    (oldPath.empty() ? "" : oldPath + " -> ") + path + (files.IsAtTaken() ? "  (taken)" : ""));
        return;
    }
    auto &entry = output.Data()["event"].append(ToObject({{"share", share},
                                                          {"event", event.type},
                                                          {"path", path},
                                                          {"data", files.Data()},
                                                          {"tmp", files.IsAtTaken()}}));
    if (!oldPath.empty()) {
        entry["path_old"] = oldPath;
    }
}

void AddRows(const std::string &share, const Backlog &backlog, Rows &rows) {
    for (const auto &[type, count] : backlog.events) {
        rows.push_back({share, EventName(type), std::to_string(count)});
    }
    if (backlog.malformed > 0) {
        rows.push_back({share, "malformed", std::to_string(backlog.malformed)});
    }
    rows.push_back({share, "all", std::to_string(backlog.Total() + backlog.malformed),
                    AgeText(backlog.oldest) + (backlog.hasTemporary ? " (.tmp present)" : "")});
}

// For programs; null for a queue that is not there or may not be read.
Json::Value Count(const std::string &share, Rows &rows, Gaps &gaps) try {
    if (const auto backlog = ReadBacklog(share, "")) {
        AddRows(share, *backlog, rows);
        return BacklogJson(*backlog);
    }
    gaps.Add("the share \"" + share + "\" is away");
    return {};
} catch (const Failure &failure) {
    gaps.AddQueue(share, failure);
    return {};
}

}  // namespace

ExitStatus ShowQueue(const Arguments &arguments, Output &output) {
    const unsigned long limit = arguments.Number("--limit", std::numeric_limits<unsigned long>::max());
    unsigned long events = 0;
    unsigned long malformed = 0;
    bool isAnyAway = false;
    Gaps gaps;
    output.Data()["event"] = Json::Value(Json::arrayValue);
    for (const auto &share : Shares(arguments)) {
        const std::string path = QueuePathOf(share);
        if (path.empty()) {
            isAnyAway = true;
            output.Warn("the share \"" + share + "\" is away");
            continue;
        }
        try {
            // A queue may be long, so its lines are shown as they are read.
            QueueFiles files(path);
            files.Visit([&](const QueueEvent *event) {
                if (event == nullptr) {
                    ++malformed;
                } else if (++events <= limit) {
                    ShowEvent(share, *event, files, output);
                }
            });
        } catch (const Failure &failure) {
            gaps.AddQueue(share, failure);
        }
    }
    const unsigned long leftOut = events - std::min(events, limit);
    output.Data()["left_out"] = ToNumber(leftOut);
    output.Data()["malformed"] = ToNumber(malformed);
    if (events + malformed == 0 && !isAnyAway && gaps.Warnings().empty()) {
        output.Note("nothing waits");
    }
    if (leftOut > 0) {
        output.Note("left out: " + std::to_string(leftOut));
    }
    if (malformed > 0) {
        output.Warn("malformed lines, which are not shown: " + std::to_string(malformed));
    }
    return gaps.Report(output);
}

ExitStatus CountQueue(const Arguments &arguments, Output &output) {
    Rows rows = {{"SHARE", "EVENT", "LINES", "OLDEST"}};
    Gaps gaps;
    auto &list = output.Data()["share"] = Json::Value(Json::arrayValue);
    for (const auto &share : Shares(arguments)) {
        list.append(ToObject({{"name", share}, {"queue", Count(share, rows, gaps)}}));
    }
    if (list.empty()) {
        output.Note("no folder is indexed");
    }
    if (rows.size() > 1) {
        output.Table(rows);
    }
    return gaps.Report(output);
}

}  // namespace VORK::FILEINDEXCTL
