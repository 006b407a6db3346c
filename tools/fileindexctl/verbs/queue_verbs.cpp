#include "command_line/handlers.h"
#include "facts/paths.h"
#include "facts/queue.h"
#include "facts/queue_files.h"
#include "report/gaps.h"
#include "report/schedule.h"
#include "report/text.h"

#include <algorithm>
#include <limits>
#include <set>

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

// A queue may be long, so its lines are shown as they are read.
class Listing {
public:
    Listing(unsigned long limit, Output &output) : left_(limit), output_(output) {
        output_.Data()["event"] = Json::Value(Json::arrayValue);
    }

    void Show(const std::string &share, QueueFiles files) {
        files.Visit([&](const QueueEvent *event) {
            if (event == nullptr) {
                ++malformed_;
            } else if (left_ == 0) {
                ++leftOut_;
            } else {
                --left_;
                ++shown_;
                ShowEvent(share, *event, files);
            }
        });
    }

    void PassOver(const std::string &share) {
        isAnyAway_ = true;
        output_.Warn("the share \"" + share + "\" is away");
    }

    void Finish(bool isWhole) {
        output_.Data()["left_out"] = static_cast<Json::UInt64>(leftOut_);
        output_.Data()["malformed"] = static_cast<Json::UInt64>(malformed_);
        if (shown_ + leftOut_ + malformed_ == 0 && !isAnyAway_ && isWhole) {
            output_.Note("nothing waits");
        }
        if (leftOut_ > 0) {
            output_.Note("left out: " + std::to_string(leftOut_));
        }
        if (malformed_ > 0) {
            output_.Warn("malformed lines, which are not shown: " + std::to_string(malformed_));
        }
    }

private:
    void ShowEvent(const std::string &share, const QueueEvent &event, QueueFiles &files) {
        const std::string path(event.path);
        const std::string oldPath(event.oldPath);
        if (!output_.IsJson()) {
            output_.Line(share + "  " + Padded(EventName(event.type)) + "  " +
                         (oldPath.empty() ? "" : oldPath + " -> ") + path +
                         (files.IsAtTaken() ? "  (taken)" : ""));
            return;
        }
        Json::Value entry(Json::objectValue);
        entry["share"] = share;
        entry["event"] = event.type;
        entry["path"] = path;
        entry["data"] = files.Data();
        entry["tmp"] = files.IsAtTaken();
        if (!oldPath.empty()) {
            entry["path_old"] = oldPath;
        }
        output_.Data()["event"].append(entry);
    }

    unsigned long left_;
    unsigned long shown_ = 0;
    bool isAnyAway_ = false;
    unsigned long leftOut_ = 0;
    unsigned long malformed_ = 0;
    Output &output_;
};

void AddRows(const std::string &share, const Backlog &backlog, std::vector<std::vector<std::string>> &rows) {
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
Json::Value Count(const std::string &share, std::vector<std::vector<std::string>> &rows, Gaps &gaps) {
    try {
        if (const auto backlog = ReadBacklog(share, "")) {
            AddRows(share, *backlog, rows);
            return BacklogJson(*backlog);
        }
        gaps.Add("the share \"" + share + "\" is away");
    } catch (const Failure &failure) {
        gaps.AddQueue(share, failure);
    }
    return {};
}

}  // namespace

ExitStatus ShowQueue(const Arguments &arguments, Output &output) {
    const auto shares = Shares(arguments);
    Listing listing(arguments.Number("--limit", std::numeric_limits<unsigned long>::max()), output);
    Gaps gaps;
    for (const auto &share : shares) {
        const std::string path = QueuePathOf(share);
        if (path.empty()) {
            listing.PassOver(share);
            continue;
        }
        try {
            listing.Show(share, QueueFiles(path));
        } catch (const Failure &failure) {
            gaps.AddQueue(share, failure);
        }
    }
    listing.Finish(gaps.Warnings().empty());
    return gaps.Report(output);
}

ExitStatus CountQueue(const Arguments &arguments, Output &output) {
    std::vector<std::vector<std::string>> rows = {{"SHARE", "EVENT", "LINES", "OLDEST"}};
    output.Data()["share"] = Json::Value(Json::arrayValue);
    const auto shares = Shares(arguments);
    Gaps gaps;
    for (const auto &share : shares) {
        Json::Value entry(Json::objectValue);
        entry["name"] = share;
        entry["queue"] = Count(share, rows, gaps);
        output.Data()["share"].append(entry);
    }
    if (shares.empty()) {
        output.Note("no folder is indexed");
    }
    if (rows.size() > 1) {
        for (const auto &line : Align(rows, output.Width())) {
            output.Line(line);
        }
    }
    return gaps.Report(output);
}

}  // namespace VORK::FILEINDEXCTL
