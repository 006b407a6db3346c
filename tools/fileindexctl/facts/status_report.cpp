#include "facts/status_report.h"

#include "facts/daemon.h"
#include "facts/paths.h"
#include "facts/queue_files.h"
#include "facts/records.h"
#include "facts/registrations.h"
#include "facts/status_file.h"
#include "report/failure.h"
#include "report/folder_text.h"
#include "report/schedule.h"
#include "report/text.h"

#include <fileindex/indexability.h>
#include <fileindex/status_mgr.h>

#include <algorithm>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::StatusMgr;

std::string Listed(const std::vector<std::string> &items) {
    return items.empty() ? "none" : Enumerate(items);
}

std::vector<std::string> MarkedShares(const StatusFile &file, const char *flag) {
    const auto shares = file.Marked(flag);
    return {shares.begin(), shares.end()};
}

std::string EventsText(const Backlog &backlog) {
    return BacklogText(backlog) + (backlog.hasTemporary ? " (.tmp present)" : "");
}

void SetState(const std::string &state, StatusReport &report) {
    report.state = state;
    report.data["status"] = state;
    report.facts.front() = {"state", state};
}

void AddService(StatusReport &report) {
    StatusFile file;
    const long long resumeTime = file.LoadPause();
    if (!StatusMgr::GetStatus(report.state)) {
        report.state = "unknown";
        report.gaps.Add("the state cannot be told: " + Records().Last());
    }
    const auto noSpace = MarkedShares(file, "no_space");
    const auto needReindex = MarkedShares(file, "need_reindex");
    const DaemonState daemon = ProbeDaemon();
    report.data["resume_time"] = static_cast<Json::Int64>(resumeTime);
    report.data["daemon"] = daemon.ForPrograms();
    report.data["no_space"] = ToArray(noSpace);
    report.data["need_reindex"] = ToArray(needReindex);
    report.facts = {{"state", ""},
                    {"pause", PauseText(resumeTime)},
                    {"daemon", daemon.text},
                    {"out of space", Listed(noSpace)},
                    {"to be reindexed", Listed(needReindex)}};
    SetState(report.state, report);
}

void AddPauses(const std::set<std::string> &shares, StatusReport &report) {
    try {
        const auto paused = PausedShares(shares);
        report.data["paused_shares"] = ToArray({paused.begin(), paused.end()});
        for (const auto &share : paused) {
            report.facts.push_back({"paused share", PausedText(share)});
        }
    } catch (const Failure &failure) {
        report.gaps.Add(std::string("which shares are paused cannot be told: ") + failure.what());
    }
}

// Folders for which nothing waits are left out of what people see.
void AddFolder(const std::string &path, const Backlog &backlog, StatusReport &report, Json::Value &list) {
    Json::Value entry(Json::objectValue);
    entry["path"] = path;
    entry["queue"] = BacklogJson(backlog);
    list.append(entry);
    if (backlog.Total() > 0) {
        report.folders.push_back({path, std::to_string(backlog.Total()), BacklogText(backlog)});
    }
}

void AddShare(const std::string &share, const Folders &folders, StatusReport &report) {
    std::vector<std::string> places = {""};
    for (const auto &folder : folders) {
        places.push_back(folder.GetFullPath());
    }
    std::vector<Backlog> backlogs;
    std::string why = "the share is away";
    try {
        backlogs = ReadBacklogs(share, places);
    } catch (const Failure &failure) {
        report.gaps.AddQueue(share, failure);
        why = "the queue may not be read";
    }
    Json::Value entry(Json::objectValue);
    entry["name"] = share;
    entry["folders"] = static_cast<Json::UInt64>(folders.size());
    entry["queue"] = backlogs.empty() ? Json::Value() : BacklogJson(backlogs.front());
    entry["folder"] = Json::Value(Json::arrayValue);
    const std::string count = std::to_string(folders.size());
    if (backlogs.empty()) {
        report.shares.push_back({share, count, "-", "-", why});
    } else {
        const Backlog &whole = backlogs.front();
        report.backlogs[share] = whole;
        report.shares.push_back(
            {share, count, std::to_string(whole.Total()), AgeText(whole.oldest), EventsText(whole)});
        for (std::size_t i = 0; i < folders.size(); ++i) {
            AddFolder(folders[i].path, backlogs[i + 1], report, entry["folder"]);
        }
    }
    report.data["share"].append(entry);
}

void AddTable(const Rows &rows, unsigned width, std::vector<std::string> &lines) {
    if (rows.size() > 1) {
        const auto table = Align(rows, width);
        lines.emplace_back();
        lines.insert(lines.end(), table.begin(), table.end());
    }
}

}  // namespace

unsigned long StatusReport::Queued() const {
    unsigned long queued = 0;
    for (const auto &[name, backlog] : backlogs) {
        queued += backlog.Total();
    }
    return queued;
}

std::string StatusReport::Taken() const {
    std::vector<std::string> items;
    for (const auto &[name, backlog] : backlogs) {
        if (backlog.hasTemporary) {
            items.push_back(name + " (" + std::to_string(backlog.taken) + ")");
        }
    }
    return items.empty() ? "nothing" : Enumerate(items);
}

std::vector<std::string> StatusReport::Lines(unsigned width) const {
    std::vector<std::string> lines = Align(facts, 0);
    AddTable(shares, width, lines);
    AddTable(folders, width, lines);
    return lines;
}

StatusReport ReportService(const std::string &onlyShare) {
    StatusReport report;
    AddService(report);
    std::map<std::string, Folders> shares;
    for (const auto &folder : ReadFolders()) {
        shares[ShareOf(folder.path)].push_back(folder);
    }
    const auto isReadable = [](const auto &entry) { return IsQueueReadable(entry.first); };
    if (report.state == "finished" && !std::all_of(shares.begin(), shares.end(), isReadable)) {
        SetState("unknown", report);
    }
    if (!onlyShare.empty()) {
        if (shares.count(onlyShare) == 0) {
            RequireShare(onlyShare);
        }
        shares = {{onlyShare, shares[onlyShare]}};
    }
    std::set<std::string> indexed;
    for (const auto &[share, folders] : shares) {
        if (!folders.empty()) {
            indexed.insert(share);
        }
    }
    AddPauses(indexed, report);
    report.shares = {{"SHARE", "FOLDERS", "QUEUED", "OLDEST", "EVENTS"}};
    report.folders = {{"FOLDER", "QUEUED", "EVENTS"}};
    report.data["share"] = Json::Value(Json::arrayValue);
    for (const auto &[share, folders] : shares) {
        AddShare(share, folders, report);
    }
    return report;
}

StatusReport ReportFolder(const std::string &given) {
    const Folders folders = ReadFolders();
    const auto &folder = RequireFolder(given, folders);
    const std::string full = folder.GetFullPath();
    Json::Value facts(Json::objectValue);
    facts["status"] = StatusMgr::GetFolderStatus(folder.path);
    facts["is_valid"] = VORK::FILEINDEX::CanPathBeIndexed(folder.path);
    const auto backlog = full.empty() ? std::nullopt : ReadBacklog(ShareOf(folder.path), full);
    StatusReport report;
    report.state = StatusText(facts);
    report.data["path"] = folder.path;
    report.data["additional"] = facts;
    report.data["queue"] = backlog ? BacklogJson(*backlog) : Json::Value();
    report.facts = {{"path", folder.path},
                    {"state", report.state},
                    {"queued", backlog ? EventsText(*backlog) : "the share is away"},
                    {"oldest", backlog ? AgeText(backlog->oldest) : "-"}};
    AddPauses({ShareOf(folder.path)}, report);
    if (backlog) {
        report.backlogs[folder.path] = *backlog;
    }
    return report;
}

}  // namespace VORK::FILEINDEXCTL
