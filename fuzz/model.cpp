#include "model.h"

#include "support.h"

#include <algorithm>
#include <iterator>
#include <set>
#include <utility>

namespace fileindex_fuzz {

namespace {

constexpr const char *kFlags[] = {"document", "audio", "video", "photo"};
constexpr int kReindex = 0x10000;
constexpr int kSetting = 0x20000;

std::string ShareOf(const std::string &path) {
    return path.substr(1, path.find('/', 1) - 1);
}

bool IsKnown(const std::string &path) {
    return std::find(std::begin(kShares), std::end(kShares), ShareOf(path)) != std::end(kShares);
}

/// The record of the last folder in the list that covers the path; null when none does.
Json::Value Governing(const Json::Value &folders, const std::string &path) {
    Json::Value found;
    for (const std::string &folder : folders.getMemberNames()) {
        if ((path + "/").starts_with(folder + "/")) {
            found = folders[folder];
        }
    }
    return found;
}

Json::Value Report(const Json::Value &before, const Json::Value &after) {
    Json::Value report(Json::objectValue);
    for (const char *flag : kFlags) {
        report[flag] = before.isNull() || after.isNull() || before[flag] != after[flag];
    }
    return report;
}

/// False when the share is not known; `folders` is then of no use.
bool Put(Json::Value &folders, Json::Value &report, const Json::Value &element) {
    const std::string path = element["path"].asString();
    if (!IsKnown(path)) {
        return false;
    }
    const Json::Value before = Governing(folders, path);
    Json::Value &record = folders[path];
    if (record.isNull()) {
        record["name"] = "";
        for (const char *flag : kFlags) {
            record[flag] = false;
        }
    }
    for (const std::string &member : element.getMemberNames()) {
        record[member] = element[member];
    }
    report = Report(before, record);
    return true;
}

}  // namespace

void Model::Command(const std::string &type, const char *key, const Json::Value &value) {
    Json::Value command(Json::objectValue);
    command["type"] = type;
    command["data"] = Json::Value(Json::objectValue);
    if (key != nullptr) {
        command["data"][key] = value;
    }
    commands_.append(command);
}

void Model::Event(int type, const std::string &path, const Json::Value &data) {
    Json::Value &queue = queues_[ShareOf(path)];
    Json::Value line(Json::objectValue);
    line["event"] = type;
    line["path"] = "/vol1" + path;
    line["data"] = data;
    const bool redundant = std::any_of(queue.begin(), queue.end(), [&](const Json::Value &queued) {
        return queued["event"] == kReindex && queued["path"] == line["path"];
    });
    if (!redundant) {
        queue.append(line);
    }
}

Json::Value Model::QueueOfShare(const std::string &share) {
    const Json::Value &queue = queues_[share];
    return queue.isNull() ? Json::Value(Json::arrayValue) : queue;
}

bool Model::HasFolderOf(const std::string &share) const {
    const auto paths = folders.getMemberNames();
    return std::any_of(paths.begin(), paths.end(),
                       [&](const std::string &path) { return ShareOf(path) == share; });
}

bool Model::Upsert(const Json::Value &request) {
    Json::Value changed = folders;
    Json::Value reports(Json::objectValue);
    for (const Json::Value &element : request) {
        Json::Value report;
        if (!Put(changed, report, element)) {
            return false;
        }
        reports[element["path"].asString()] = report;
    }
    folders = changed;
    for (const Json::Value &element : request) {
        Command("upsert_folder_setting", "folder_path", element["path"]);
    }
    for (const std::string &path : reports.getMemberNames()) {
        Event(kSetting, path, reports[path]);
    }
    return true;
}

bool Model::Delete(const Json::Value &paths) {
    Json::Value reports(Json::objectValue);
    std::set<std::string> shares;
    for (const Json::Value &element : paths) {
        const std::string path = element.asString();
        const Json::Value before = Governing(folders, path);
        folders.removeMember(path);
        reports[path] = Json::Value(Json::objectValue);
        reports[path][path] = Report(before, Governing(folders, path));
        shares.insert(ShareOf(path));
    }
    if (!folders.empty()) {
        for (const Json::Value &path : paths) {
            Command("delete_folder_setting", "folder_path", path);
        }
        for (const std::string &path : reports.getMemberNames()) {
            Event(kSetting, path, reports[path]);
        }
    }
    for (const std::string &share : shares) {
        if (!HasFolderOf(share)) {
            queues_.erase(share);
        }
    }
    return true;
}

bool Model::Reindex(const Json::Value &paths) {
    const Json::Value &marked = std::as_const(status)["no_space"];  // not made by asking
    std::set<std::string> outOfSpace;
    for (const Json::Value &path : paths) {
        const std::string share = ShareOf(path.asString());
        if (!HasFolderOf(share)) {
            return false;
        }
        if (marked.isMember(share)) {
            outOfSpace.insert(share);
        }
    }
    for (const std::string &share : outOfSpace) {
        SetFlag("no_space", share, false);
        Command("revive_share_worker", "share_name", share);
    }
    for (const Json::Value &path : paths) {
        Event(kReindex, path.asString(), Json::Value());
    }
    return true;
}

bool Model::ShareRename(const std::string &from, const std::string &to) {
    Json::Value changed = folders;
    for (const std::string &path : folders.getMemberNames()) {
        if (ShareOf(path) != from) {
            continue;
        }
        Json::Value record = folders[path];
        record["path"] = "/" + to + path.substr(1 + from.size());
        changed.removeMember(path);
        Json::Value report;
        if (!Put(changed, report, record)) {
            return false;
        }
    }
    folders = changed;
    return true;
}

bool Model::ShareRemove(const std::string &share) {
    for (const std::string &path : folders.getMemberNames()) {
        if (ShareOf(path) == share) {
            folders.removeMember(path);
        }
    }
    return true;
}

void Model::SetFlag(const char *key, const std::string &share, bool set) {
    if (set) {
        status[key][share] = true;
    } else {
        (void)status[key];  // comes into being all the same
        status[key].removeMember(share);
    }
}

}  // namespace fileindex_fuzz
