// "reindex" and "revive": what has the daemon start again.
#include "facts/patience.h"
#include "facts/queue.h"
#include "facts/rules.h"
#include "facts/status_file.h"
#include "report/steps.h"
#include "verbs/verb.h"

#include <fileindex/fileidx.h>
#include <fileindex/indexability.h>

#include <array>
#include <cerrno>
#include <iterator>

namespace VORK::FILEINDEXCTL {

namespace {

using Places = std::vector<Place>;

const Mark kQueueLocked = {records::kEventDropped};

void WarnOfPlace(const Place &place, const Folders &folders, Output &output) {
    if (const auto found = FirstUnreachable(place.fullPath);
        found && (found->error == ENOENT || found->error == ENOTDIR)) {
        output.Warn(Quoted(found->part) + " does not exist");
    }
    if (Covering(AsFullPath(place), folders).empty()) {
        const auto inside = Contained(AsFullPath(place), folders);
        output.Warn(Quoted(place.path) + " lies in no indexed folder" +
                    (inside.empty() ? "" : ", but holds " + Enumerate(inside)));
    }
}

Places Requested(const Arguments &arguments, const Folders &folders, Output &output) {
    Places places;
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
        WarnOfPlace(place, folders, output);
        places.push_back(place);
    }
    return places;
}

std::vector<PlannedStep> Plan(const Places &places) {
    std::set<std::string> full;
    std::set<std::string> shares;
    for (const auto &place : places) {
        const std::string share = ShareOf(place.path);
        shares.insert(share);
        if (StatusMgr::ShareIsNoSpace(share)) {
            full.insert(share);
        }
    }
    std::vector<PlannedStep> plan;
    plan.reserve(full.size());
    for (const auto &share : full) {
        plan.push_back({share + " revived",
                        "the share stays marked as out of space, or fileindexd cannot be reached",
                        {},
                        {{records::kReindexRevive, "share=" + share}}});
    }
    const std::vector<Mark> fatal = {{records::kReindexPath}, {records::kReindexEvent}};
    plan.push_back({"events queued", "an event could not be queued", fatal, {}, Evidence::kNone, shares});
    return plan;
}

bool IsQueued(const Place &place) {
    return IsReindexQueued(ShareOf(place.path), place.fullPath);
}

// Success of the library also covers an event that was dropped, so the queues are read again. What is neither
// there nor dropped was there and is not any more; who took it, and what became of it, nobody tells.
bool StateQueued(const Places &places, bool lost, Output &output) {
    bool any = !lost;
    for (const auto &place : places) {
        const bool queued = IsQueued(place);
        any = any || queued;
        output.Data()["reindex"].append(ToObject({{"path", place.path},
                                                  {"state", queued ? "queued"
                                                            : lost ? "not_queued"
                                                                   : "not_waiting"}}));
        output.Line(place.path + (queued ? " waits in the queue to be reindexed"
                                  : lost ? " is not queued"
                                         : " was queued, and no longer waits in the queue"));
    }
    return any;
}

StepReport PerformReindex(const Places &places) {
    const std::vector<PlannedStep> plan = Plan(places);
    ForgetErrors();
    StepReport report = StepReport::Trace(plan, IndexMgr::Reindex(ToArray(places, &Place::path)));
    MarkDroppedEvents(report);
    return report;
}

// The places whose events were dropped because a queue stayed locked. None when it cannot be told, since the
// daemon has taken others meanwhile.
Places Dropped(const Places &places) {
    const std::size_t count = Records().Count(kQueueLocked);
    if (count == 0) {
        return {};
    }
    Places dropped;
    std::remove_copy_if(places.begin(), places.end(), std::back_inserter(dropped), IsQueued);
    return dropped.size() == count ? dropped : Places();
}

Failure WhyNotQueued(const Places &places, bool anyQueued) {
    if (anyQueued) {
        return {ExitStatus::kPartly, "not everything is queued; the system log says why"};
    }
    if (Records().Find(kQueueLocked) != nullptr) {
        return {ExitStatus::kBusy, "the queue is locked by another program; try again"};
    }
    std::array<char, 4096> queue{};
    FILEIDXQueuePathGet(ShareOf(places.front().path).c_str(), queue.data(), queue.size());
    const std::string path = queue.data();
    return MayNotWrite(path) ? Denied(path) : Failure(ExitStatus::kCannotSave, path + " cannot be written");
}

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

ExitStatus ReviveOne(const std::string &share, Patience &patience, StepReport &all, Output &output) try {
    if (!FILEINDEX::IsShareSpaceEnough(share)) {
        return output.Conclude(ExitStatus::kCannotSave,
                               "the share \"" + share + "\" still has no room for index data (10 MiB)");
    }
    const std::vector<PlannedStep> plan = {
        SaveStep("saved for " + share),
        {"daemon told of " + share, "fileindexd cannot be reached", {{records::kReviveSend}}},
    };
    const StepReport report =
        StepReport::Perform(plan, FILEINDEX::Status(), patience, [&] { return StatusMgr::ShareRevive(share); });
    all.Append(report);
    return output.Conclude(report.Status(), "fileindexd does not know of the share \"" + share +
                                                "\"; once it runs, repeat the command");
} catch (const Failure &failure) {
    return output.Conclude(failure.Status(), failure.what());
}

}  // namespace

ExitStatus ReindexPaths(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const Folders folders = ReadFolders();
    const Places places = Requested(arguments, folders, output);
    RequireMayChange();
    StepReport report = PerformReindex(places);
    for (auto left = Dropped(places); !left.empty() && patience.Again(); left = Dropped(left)) {
        report = PerformReindex(left);
    }
    report.Show(output);
    const bool lost = report.Has(StepResult::kFailed);
    const bool anyQueued = StateQueued(places, lost, output);
    if (lost) {
        throw WhyNotQueued(places, anyQueued);
    }
    return ExitStatus::kDone;
}

ExitStatus ReviveShares(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const auto &shares = arguments.All("SHARE");
    for (const auto &share : shares) {
        RequireShare(share);
    }
    RequireMarks();
    StepReport report;
    std::set<ExitStatus> results;
    for (const auto &share : shares) {
        results.insert(ReviveOne(share, patience, report, output));
    }
    report.Show(output);
    for (const auto &share : shares) {
        const bool marked = StatusMgr::ShareIsNoSpace(share);
        output.Data()["no_space"][share] = marked;
        output.Line(share + (marked ? " is marked as out of space" : " is not marked as out of space"));
    }
    // One status for several shares: what they have in common, else "partly".
    return results.size() == 1 ? *results.begin() : ExitStatus::kPartly;
}

}  // namespace VORK::FILEINDEXCTL
