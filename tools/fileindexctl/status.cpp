#include "daemon.h"
#include "failure.h"
#include "folder_text.h"
#include "handlers.h"
#include "paths.h"
#include "queue.h"
#include "records.h"
#include "schedule.h"
#include "status_file.h"
#include "text.h"

#include <fileindex/indexability.h>
#include <fileindex/status.h>
#include <fileindex/status_mgr.h>

#include <map>
#include <set>

namespace fileindexctl {

namespace {

using VORK::FILEINDEX::StatusMgr;

void ShowRows(const std::vector<std::vector<std::string>> &rows, unsigned width, Output &output) {
    for (const auto &line : Align(rows, width)) {
        output.Line(line);
    }
}

std::string Listed(const std::vector<std::string> &items) {
    return items.empty() ? "none" : Enumerate(items);
}

void ShowService(Output &output) {
    StatusFile file;
    std::string state;
    long long resumeTime = -1;
    ForgetErrors();
    if (!file.Load()) {
        throw FailureOf(file);
    }
    if (!file.GetPauseInfo(resumeTime)) {
        throw Failure(ExitStatus::Malformed, file.GetPath() + ": \"resume_time\" is no number");
    }
    if (!StatusMgr::GetStatus(state)) {
        state = "unknown";
        output.Warn("the state cannot be told: " + Records().Last());
    }
    const auto noSpace = file.Marked("no_space");
    const auto needReindex = file.Marked("need_reindex");
    const DaemonState daemon = ProbeDaemon();
    auto &data = output.Data();
    data["status"] = state;
    data["resume_time"] = static_cast<Json::Int64>(resumeTime);
    data["daemon"] = daemon.reachable;
    data["no_space"] = ToArray(noSpace);
    data["need_reindex"] = ToArray(needReindex);
    ShowRows({{"state", state},
              {"pause", PauseText(resumeTime)},
              {"daemon", daemon.text},
              {"out of space", Listed(noSpace)},
              {"to be reindexed", Listed(needReindex)}},
             0, output);
}

void ShowShares(const Folders &folders, const std::string &only, Output &output) {
    std::map<std::string, unsigned> shares;
    for (const auto &folder : folders) {
        ++shares[ShareOf(folder.path)];
    }
    if (!only.empty()) {
        shares = {{only, shares[only]}};
    }
    std::vector<std::vector<std::string>> rows = {{"SHARE", "FOLDERS", "QUEUED", "OLDEST", "EVENTS"}};
    output.Data()["share"] = Json::Value(Json::arrayValue);
    for (const auto &[share, count] : shares) {
        const auto backlog = ReadBacklog(share, "");
        Json::Value entry(Json::objectValue);
        entry["name"] = share;
        entry["folders"] = count;
        entry["queue"] = backlog ? BacklogJson(*backlog) : Json::Value();
        output.Data()["share"].append(entry);
        if (!backlog) {
            rows.push_back({share, std::to_string(count), "-", "-", "the share is away"});
            continue;
        }
        rows.push_back({share, std::to_string(count), std::to_string(backlog->Total()), AgeText(backlog->oldest),
                        BacklogText(*backlog) + (backlog->hasTemporary ? " (.tmp present)" : "")});
    }
    if (rows.size() > 1) {
        output.Line("");
        ShowRows(rows, output.Width(), output);
    }
}

void ShowFolderProgress(const std::string &given, const Folders &folders, Output &output) {
    const auto &folder = RequireFolder(given, folders);
    const std::string full = folder.GetFullPath();
    Json::Value facts(Json::objectValue);
    facts["status"] = StatusMgr::GetFolderStatus(folder.path);
    facts["is_valid"] = VORK::FILEINDEX::CanPathBeIndexed(folder.path);
    const auto backlog = full.empty() ? std::nullopt : ReadBacklog(ShareOf(folder.path), full);
    output.Data()["path"] = folder.path;
    output.Data()["additional"] = facts;
    output.Data()["queue"] = backlog ? BacklogJson(*backlog) : Json::Value();
    ShowRows({{"path", folder.path},
              {"state", StatusText(facts)},
              {"queued", backlog ? BacklogText(*backlog) : "the share is away"}},
             0, output);
}

}  // namespace

ExitStatus ShowStatus(const Arguments &arguments, Output &output) {
    if (arguments.Has("PATH") && arguments.Has("--share")) {
        throw Failure(ExitStatus::Usage, "give a path or --share, not both");
    }
    const Folders folders = ReadFolders();
    if (arguments.Has("PATH")) {
        ShowFolderProgress(arguments.One("PATH"), folders, output);
        return ExitStatus::Done;
    }
    if (arguments.Has("--share")) {
        RequireShare(arguments.One("--share"));
    }
    ShowService(output);
    ShowShares(folders, arguments.One("--share"), output);
    return ExitStatus::Done;
}

}  // namespace fileindexctl
