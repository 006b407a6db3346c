#include "command_line/handlers.h"
#include "facts/paths.h"
#include "facts/queue.h"
#include "facts/rules.h"
#include "facts/status_file.h"
#include "report/failure.h"
#include "report/steps.h"
#include "report/text.h"

#include <fileindex/fileidx.h>
#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>
#include <fileindex/status.h>
#include <fileindex/status_mgr.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <iterator>
#include <set>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::IndexMgr;
using VORK::FILEINDEX::StatusMgr;

std::vector<Place> Requested(const Arguments &arguments, const Folders &folders, Output &output) {
    std::vector<Place> places;
    for (const auto &given : arguments.All("PATH")) {
        const Place place = RequirePlain(given, folders);
        const std::string share = ShareOf(place.path);
        if (!IndexMgr::IsShareIndexed(share)) {
            throw Failure(ExitStatus::kNoSuchFolder, "no folder of the share \"" + share + "\" is indexed");
        }
        if (std::any_of(places.begin(), places.end(),
                        [&](const Place &other) { return other.path == place.path; })) {
            output.Warn("\"" + place.path + "\" is given twice");
            continue;
        }
        if (const auto found = FirstUnreachable(place.fullPath);
            found && (found->error == ENOENT || found->error == ENOTDIR)) {
            output.Warn(Quoted(found->part) + " does not exist");
        }
        if (Covering(AsFullPath(place), folders).empty()) {
            const auto inside = Contained(AsFullPath(place), folders);
            output.Warn(Quoted(place.path) + " lies in no indexed folder" +
                        (inside.empty() ? "" : ", but holds " + Enumerate(inside)));
        }
        places.push_back(place);
    }
    return places;
}

std::vector<PlannedStep> Plan(const std::vector<Place> &places) {
    std::set<std::string> full;
    std::set<std::string> shares;
    for (const auto &place : places) {
        shares.insert(ShareOf(place.path));
        if (StatusMgr::ShareIsNoSpace(ShareOf(place.path))) {
            full.insert(ShareOf(place.path));
        }
    }
    std::vector<PlannedStep> plan;
    plan.reserve(full.size() + 1);
    for (const auto &share : full) {
        plan.push_back({share + " revived",
                        "the share stays marked as out of space, or fileindexd cannot be reached",
                        {},
                        {{records::kReindexRevive, "share=" + share}}});
    }
    plan.push_back({"events queued",
                    "an event could not be queued",
                    {{records::kReindexPath}, {records::kReindexEvent}},
                    {},
                    Evidence::kNone,
                    shares});
    return plan;
}

// Success of the library also covers an event that was dropped, so the queues are read again. What is neither
// there nor dropped was there and is not any more; who took it, and what became of it, nobody tells.
bool StateQueued(const std::vector<Place> &places, const StepReport &report, Output &output) {
    bool any = false;
    const bool lost = report.Has(StepResult::kFailed);
    for (const auto &place : places) {
        const bool queued = IsReindexQueued(ShareOf(place.path), place.fullPath);
        const bool gone = !queued && !lost;
        any = any || queued || gone;
        Json::Value entry(Json::objectValue);
        entry["path"] = place.path;
        entry["state"] = queued ? "queued" : gone ? "not_waiting" : "not_queued";
        output.Data()["reindex"].append(entry);
        output.Line(Printable(place.path) + (queued ? " waits in the queue to be reindexed"
                                             : gone ? " was queued, and no longer waits in the queue"
                                                    : " is not queued"));
    }
    return any;
}

StepReport PerformReindex(const std::vector<Place> &places) {
    Json::Value request(Json::arrayValue);
    for (const auto &place : places) {
        request.append(place.path);
    }
    const std::vector<PlannedStep> plan = Plan(places);
    ForgetErrors();
    StepReport report = StepReport::Trace(plan, IndexMgr::Reindex(request));
    MarkDroppedEvents(report);
    return report;
}

// The places whose events were dropped because a queue stayed locked. None when it cannot be told, since the
// daemon has taken others meanwhile.
std::vector<Place> Dropped(const std::vector<Place> &places) {
    const std::size_t count = Records().Count({records::kEventDropped});
    if (count == 0) {
        return {};
    }
    std::vector<Place> dropped;
    std::copy_if(places.begin(), places.end(), std::back_inserter(dropped),
                 [](const Place &place) { return !IsReindexQueued(ShareOf(place.path), place.fullPath); });
    return dropped.size() == count ? dropped : std::vector<Place>();
}

Failure WhyNotQueued(const std::vector<Place> &places, bool anyQueued) {
    if (anyQueued) {
        return {ExitStatus::kPartly, "not everything is queued; the system log says why"};
    }
    if (Records().Find({records::kEventDropped}) != nullptr) {
        return {ExitStatus::kBusy, "the queue is locked by another program; try again"};
    }
    std::array<char, 4096> queue{};
    FILEIDXQueuePathGet(ShareOf(places.front().path).c_str(), queue.data(), queue.size());
    const std::string path = queue.data();
    return MayNotWrite(path) ? Denied(path) : Failure(ExitStatus::kCannotSave, path + " cannot be written");
}

struct Revival {
    ExitStatus status;
    std::string trouble;
};

// The library does not say what it found wrong with the marks.
void RequireMarks() {
    StatusFile file;
    ForgetErrors();
    if (!file.Load()) {
        throw FailureOf(file);
    }
    const Json::Value marks = file.Document().get("no_space", Json::objectValue);
    if (!marks.isObject() && !marks.isNull()) {
        throw Failure(ExitStatus::kMalformed,
                      file.GetPath() + ": \"no_space\" is no object; \"fileindexctl doctor --fix\" mends it");
    }
}

Revival ReviveOne(const std::string &share, Patience &patience, StepReport &all) {
    if (!VORK::FILEINDEX::IsShareSpaceEnough(share)) {
        return {ExitStatus::kCannotSave, "the share \"" + share + "\" still has no room for index data (10 MiB)"};
    }
    const std::vector<PlannedStep> plan = {
        SaveStep("saved for " + share),
        {"daemon told of " + share, "fileindexd cannot be reached", {{records::kReviveSend}}},
    };
    const StepReport report = StepReport::Perform(plan, VORK::FILEINDEX::Status(), patience,
                                                  [&] { return StatusMgr::ShareRevive(share); });
    all.Append(report);
    return {report.Status(),
            "fileindexd does not know of the share \"" + share + "\"; once it runs, repeat the command"};
}

}  // namespace

ExitStatus ReindexPaths(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const Folders folders = ReadFolders();
    const std::vector<Place> places = Requested(arguments, folders, output);
    RequireMayChange();
    StepReport report = PerformReindex(places);
    for (auto left = Dropped(places); !left.empty() && patience.Again(); left = Dropped(left)) {
        report = PerformReindex(left);
    }
    report.Show(output);
    const bool anyQueued = StateQueued(places, report, output);
    if (!report.Has(StepResult::kFailed)) {
        return ExitStatus::kDone;
    }
    throw WhyNotQueued(places, anyQueued);
}

ExitStatus ReviveShares(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    StepReport report;
    std::vector<ExitStatus> results;
    for (const auto &share : arguments.All("SHARE")) {
        RequireShare(share);
    }
    RequireMarks();
    for (const auto &share : arguments.All("SHARE")) {
        Revival revival{ExitStatus::kDone, {}};
        try {
            revival = ReviveOne(share, patience, report);
        } catch (const Failure &failure) {
            revival = {failure.Status(), failure.what()};
        }
        results.push_back(revival.status);
        if (revival.status != ExitStatus::kDone) {
            output.Error(revival.status, revival.trouble);
        }
    }
    report.Show(output);
    for (const auto &share : arguments.All("SHARE")) {
        const bool marked = StatusMgr::ShareIsNoSpace(share);
        output.Data()["no_space"][share] = marked;
        output.Line(Printable(share) + (marked ? " is marked as out of space" : " is not marked as out of space"));
    }
    // One status for several shares: what they have in common, else "partly".
    const bool same =
        std::all_of(results.begin(), results.end(), [&](ExitStatus result) { return result == results.front(); });
    return same ? results.front() : ExitStatus::kPartly;
}

}  // namespace VORK::FILEINDEXCTL
