#include "verbs/import_plan.h"

#include "report/failure.h"
#include "report/folder_text.h"
#include "report/schedule.h"
#include "report/text.h"
#include "verbs/folder_operations.h"

#include <fileindex/paths.h>

#include <algorithm>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr std::size_t kMostFolders = 1000;

using Rows = std::vector<std::vector<std::string>>;

// The share of a folder that changes has to be there, and a new path has to be spelt as "add" wants it.
void RequireUsable(const FolderChange &change, const Folders &folders, const std::string &source) {
    const std::string path = change.to["path"].asString();
    try {
        if (!change.from.isNull()) {
            RequireShare(ShareOf(path));
        } else if (RequirePlain(path, folders).path != path) {
            throw Failure(ExitStatus::kUsage, "\"" + path + "\" is to be written without the \"/\" at its end");
        }
    } catch (const Failure &failure) {
        throw Failure(failure.Status() == ExitStatus::kUsage ? ExitStatus::kMalformed : failure.Status(),
                      source + ": folder[" + Quoted(path) + "]: " + failure.what());
    }
}

void PlanFolders(const FolderRecords &wanted, const std::string &source, bool replace, ImportPlan &plan) {
    const FolderRecords stored = StoredFolders();
    const Folders folders = ReadFolders();
    std::size_t added = 0;
    for (const auto &[path, record] : wanted) {
        const auto found = stored.find(path);
        const FolderChange change{found == stored.end() ? Json::Value() : found->second, record};
        if (change.from != change.to) {
            RequireUsable(change, folders, source);
            plan.folders.push_back(change);
        }
        added += change.from.isNull() ? 1 : 0;
    }
    for (const auto &[path, record] : stored) {
        if (wanted.find(path) != wanted.end()) {
            continue;
        }
        if (replace) {
            plan.removal.Add(path);
        } else {
            plan.kept.push_back(path);
        }
    }
    const std::size_t total = stored.size() + added - plan.removal.All().size();
    if (added > 0 && total > kMostFolders) {
        throw Failure(ExitStatus::kCannotSave, source + ": there would be " + std::to_string(total) +
                                                   " folders, and no more than 1000 can be indexed");
    }
}

void PlanFlags(const std::string &member, const std::set<std::string> &stored, const std::set<std::string> &wanted,
               ImportPlan &plan) {
    for (const auto &name : wanted) {
        if (stored.count(name) == 0) {
            plan.flags.push_back({member, name, true});
        }
    }
    for (const auto &name : stored) {
        if (wanted.count(name) == 0) {
            plan.flags.push_back({member, name, false});
        }
    }
}

void PlanStatus(const StatusSettings &wanted, const std::string &source, ImportPlan &plan) {
    const StatusSettings stored = StoredStatus();
    plan.pausedFrom = stored.resumeTime;
    if (stored.resumeTime != wanted.resumeTime) {
        if (wanted.resumeTime > kLatestEnd) {
            throw Failure(ExitStatus::kMalformed, source + ": status[\"resume_time\"]: a pause cannot end after " +
                                                      std::to_string(kLatestEnd));
        }
        plan.pause = wanted.resumeTime;
    }
    PlanFlags("no_space", stored.noSpace, wanted.noSpace, plan);
    PlanFlags("need_reindex", stored.needReindex, wanted.needReindex, plan);
    for (const auto &name : wanted.markers) {  // the library can set them, not take them back
        if (stored.markers.count(name) == 0) {
            plan.flags.push_back({"marker", name, true});
        }
    }
}

std::vector<std::string> Row(const FolderChange &change) {
    const std::string path = change.to["path"].asString();
    const std::string name = Quoted(change.to["name"].asString());
    const std::string media = MediaText(change.to);
    if (change.from.isNull()) {
        return {"add", path, name + ": " + media};
    }
    std::string what;
    if (change.from["name"] != change.to["name"]) {
        what = Quoted(change.from["name"].asString()) + " -> " + name;
    }
    if (MediaText(change.from) != media) {
        what += (what.empty() ? "" : "; ") + MediaText(change.from) + " -> " + media;
    }
    return {"change", path, what};
}

Json::Value Array(const std::vector<std::string> &items) {
    Json::Value array(Json::arrayValue);
    for (const auto &item : items) {
        array.append(item);
    }
    return array;
}

}  // namespace

ImportPlan PlanImport(const Configuration &wanted, const std::string &source, bool replace) {
    ImportPlan plan;
    if (wanted.folders) {
        PlanFolders(*wanted.folders, source, replace, plan);
    }
    if (wanted.status) {
        PlanStatus(*wanted.status, source, plan);
    }
    return plan;
}

void ImportPlan::Show(Output &output) const {
    auto &data = output.Data();
    data["added"] = data["changed"] = data["status"] = Json::Value(Json::arrayValue);
    data["removed"] = Array(removal.All());
    data["kept"] = Array(kept);
    Rows rows;
    for (const auto &change : folders) {
        const std::string path = change.to["path"].asString();
        if (change.from.isNull()) {
            std::string fullPath;
            VORK::FILEINDEX::GetFullPath(fullPath, path);
            WarnOfObstacle(path, fullPath, output);
        }
        rows.push_back(Row(change));
        Json::Value pair(Json::objectValue);
        pair["from"] = change.from;
        pair["to"] = change.to;
        data[change.from.isNull() ? "added" : "changed"].append(change.from.isNull() ? change.to : pair);
    }
    for (const auto &path : removal.All()) {
        rows.push_back({"remove", path});
    }
    for (const auto &path : kept) {
        rows.push_back({"keep", path, "not in the file; --replace removes it"});
    }
    if (pause) {
        rows.push_back({"set", "resume_time", PauseText(*pause)});
        Json::Value entry(Json::objectValue);
        entry["member"] = "resume_time";
        entry["from"] = static_cast<Json::Int64>(pausedFrom);
        entry["to"] = static_cast<Json::Int64>(*pause);
        data["status"].append(entry);
    }
    for (const auto &flag : flags) {
        rows.push_back({flag.value ? "set" : "clear", flag.member, flag.Text()});
        Json::Value entry(Json::objectValue);
        entry["member"] = flag.member;
        entry["name"] = flag.name;
        entry["to"] = flag.value;
        data["status"].append(entry);
    }
    for (const auto &line : Align(rows, 0)) {
        output.Line(line);
    }
}

}  // namespace VORK::FILEINDEXCTL
