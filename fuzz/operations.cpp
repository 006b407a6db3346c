// A sequence of operations on the library and on a model in memory: after each of them folder.conf, status.conf,
// the queues and the daemon's commands are those of the model.

#include "base/json/text.h"
#include "checks.h"
#include "folders/media_kinds.h"
#include "names.h"

#include <fileindex/index_mgr.h>
#include <fileindex/status_mgr.h>

#include <map>
#include <set>
#include <utility>
#include <vector>

namespace fileindex_fuzz {

namespace {

using VORK::JsonReader;
using VORK::ToString;
using VORK::FILEINDEX::IndexMgr;
using VORK::FILEINDEX::StatusMgr;
namespace names = VORK::FILEINDEX::internal;

constexpr const char *kPaths[] = {"/a", "/a/d", "/a/d/e", "/a/dd", "/b", "/b/d", "/photo/d", "/ro", "/away/d"};
constexpr const char *kNames[] = {"a", "b", "photo", "ro", "away"};
constexpr char kReindex[] = "65536";
constexpr char kSetting[] = "131072";

/// The record of the last folder in the list that covers the path; null when none does.
Json::Value Governing(const Json::Value &folders, const std::string &path) {
    Json::Value found;
    for (const std::string &folder : folders.getMemberNames()) {
        found = (path + "/").starts_with(folder + "/") ? folders[folder] : found;
    }
    return found;
}

Json::Value Report(const Json::Value &before, const Json::Value &after) {
    Json::Value report;
    for (const auto &[flag, member] : names::kMediaKinds) {
        report[flag] = before.isNull() || after.isNull() || before[flag] != after[flag];
    }
    return report;
}

/// The report; null when the share is not known, and `folders` is then of no use.
Json::Value Put(Json::Value &folders, const Json::Value &element) {
    const std::string path = element["path"].asString();
    const Json::Value before = Governing(folders, path);
    Json::Value &record = folders[path];
    record["path"] = path;
    record["name"] = element.get("name", record.get("name", ""));
    for (const auto &[flag, member] : names::kMediaKinds) {
        record[flag] = element.get(flag, record.get(flag, false));
    }
    return IsKnown(path) ? Report(before, record) : Json::Value();
}

/// A line of a queue.
std::string Line(const char *type, const std::string &path, const Json::Value &data) {
    return R"({"data":)" + ToString(data) + R"(,"event":)" + type + R"(,"path":"/vol1)" + path + "\"}\n";
}

Json::Value PathsOf(const Json::Value &records) {
    Json::Value paths(Json::arrayValue);
    for (const Json::Value &record : records) {
        paths.append(record["path"]);
    }
    return paths;
}

/// What the operations mean, in documents and texts: the files, the queues and the commands as they have to be.
struct Model {
    Json::Value folders{Json::objectValue};
    Json::Value status{Json::objectValue};
    std::map<std::string, std::string> queues;  ///< by share
    std::string commands;

    std::vector<std::string> FoldersOf(const std::string &share) const {
        std::vector<std::string> paths = folders.getMemberNames();
        std::erase_if(paths, [&](const std::string &path) { return ShareOf(path) != share; });
        return paths;
    }

    void Command(const char *type, const char *key = "", const std::string &value = "") {
        commands += std::string(R"({"data":{)") + key + value + R"(},"type":")" + type + "\"}\n";
    }

    void Event(const char *type, const std::string &path, const Json::Value &data) {
        std::string &queue = queues[ShareOf(path)];
        if (queue.find(Line(kReindex, path, {})) == std::string::npos) {
            queue += Line(type, path, data);
        }
    }

    void ReportChanges(const char *command, const Json::Value &paths, const Json::Value &reports) {
        for (const Json::Value &path : paths) {
            Command(command, R"("folder_path":)", ToString(path));
        }
        for (const std::string &path : reports.getMemberNames()) {
            Event(kSetting, path, reports[path]);
        }
    }

    bool Upsert(const Json::Value &request) {
        Json::Value changed = folders;
        Json::Value reports;
        for (const Json::Value &element : request) {
            Json::Value &report = reports[element["path"].asString()];
            report = Put(changed, element);
            if (report.isNull()) {
                return false;
            }
        }
        folders = changed;
        ReportChanges("upsert_folder_setting", PathsOf(request), reports);
        return true;
    }

    bool Delete(const Json::Value &paths) {
        Json::Value reports;
        for (const Json::Value &element : paths) {
            const std::string path = element.asString();
            const Json::Value before = Governing(folders, path);
            folders.removeMember(path);
            reports[path] = Json::Value(Json::objectValue);
            reports[path][path] = Report(before, Governing(folders, path));
        }
        if (!folders.empty()) {
            ReportChanges("delete_folder_setting", paths, reports);
        }
        for (const Json::Value &path : paths) {
            const std::string share = ShareOf(path.asString());
            if (FoldersOf(share).empty()) {
                queues.erase(share);
            }
        }
        return true;
    }

    bool Reindex(const Json::Value &paths) {
        std::set<std::string> shares;
        for (const Json::Value &path : paths) {
            shares.insert(ShareOf(path.asString()));
            if (FoldersOf(ShareOf(path.asString())).empty()) {
                return false;
            }
        }
        for (const std::string &share : std::as_const(status)["no_space"].getMemberNames()) {
            if (shares.contains(share)) {
                Revive(share);
            }
        }
        for (const Json::Value &path : paths) {
            Event(kReindex, path.asString(), {});
        }
        return true;
    }

    bool ShareRename(const std::string &from, const std::string &to) {
        Json::Value changed = folders;
        for (const std::string &path : FoldersOf(from)) {
            Json::Value record = folders[path];
            record["path"] = "/" + to + path.substr(1 + from.size());
            changed.removeMember(path);
            if (Put(changed, record).isNull()) {
                return false;
            }
        }
        folders = changed;
        return true;
    }

    void SetFlag(const char *key, const std::string &share, bool set) {
        Json::Value &marked = status[key];  // comes into being in any case
        if (set) {
            marked[share] = true;
        } else {
            marked.removeMember(share);
        }
    }

    void Revive(const std::string &share) {
        SetFlag("no_space", share, false);
        Command("revive_share_worker", R"("share_name":)", '"' + share + '"');
    }
};

Json::Value SomeRecords(Input &input, std::size_t most) {
    Json::Value records(Json::arrayValue);
    for (std::size_t left = input.Below(most + 1); left > 0; --left) {
        Json::Value &record = records.append(Json::objectValue);
        record["path"] = input.OneOf(kPaths);
        for (const auto &[flag, member] : names::kMediaKinds) {
            if (input.OneIn(2)) {
                record[flag] = input.OneIn(2);
            }
        }
        if (input.OneIn(2)) {
            record["name"] = input.Text("p");
        }
    }
    return records;
}

/// Do the library and the model give the same answer?
bool Step(Input &input, Model &model, std::size_t operation) {
    const std::string share = input.OneOf(kNames);
    const std::string to = input.OneOf(kNames);
    const bool set = input.OneIn(2);
    const Json::Value records = SomeRecords(input, operation < 3 ? 3 : 0);
    const Json::Value paths = PathsOf(records);
    switch (operation) {
        case 0:
            return IndexMgr::Upsert(records) == model.Upsert(records);
        case 1:  // a share that is away has no event: see the tests
            return ToString(paths).find("away") != std::string::npos ||
                   IndexMgr::Delete(paths) == model.Delete(paths);
        case 2:
            return IndexMgr::Reindex(paths) == model.Reindex(paths);
        case 3:
            return IndexMgr::ShareRename(share, to) == model.ShareRename(share, to);
        case 4:
            for (const std::string &path : model.FoldersOf(share)) {
                model.folders.removeMember(path);
            }
            return IndexMgr::ShareRemove(share);
        case 5:
            model.Command("pause", R"("resume_time":0)");
            model.status["resume_time"] = 0;
            return StatusMgr::Pause(0) && !StatusMgr::Pause(-1);
        case 6:
            model.Command("resume");
            model.status["resume_time"] = -1;
            return StatusMgr::Resume();
        case 7:
            model.SetFlag("no_space", share, set);
            return StatusMgr::ShareSetNoSpace(share, set) && StatusMgr::ShareIsNoSpace(share) == set;
        case 8:
            model.SetFlag("need_reindex", share, set);
            return StatusMgr::ShareSetNeedReindex(share, set) && StatusMgr::ShareIsNeedReindex(share) == set;
        case 9:
            model.Revive(share);
            return StatusMgr::ShareRevive(share);
        case 10:
            model.status["upgrade_" + to] = true;
            return StatusMgr::SetUpdated("upgrade_" + to) && StatusMgr::IsUpdated("upgrade_" + to);
        default:
            model.Command("delete_share_worker", R"("share_name":)", '"' + share + '"');
            return IndexMgr::SharePause(share) == (share != "away");
    }
}

void Compare(const char *what, const std::string &is, const std::string &expected) {
    Require(is == expected, what, "\nis       " + is + "\nexpected " + expected);
}

std::string FileAsText(const char *path) {
    Json::Value document(Json::objectValue);
    const std::string text = ReadWhole(path);
    Require(text.empty() || JsonReader().Parse(text, document), "a broken file", text);
    return ToString(document);
}

void CompareAll(Model &model) {
    Compare("folder.conf differs", FileAsText(names::kFolderConf), ToString(model.folders));
    Compare("status.conf differs", FileAsText(names::kStatusConf), ToString(model.status));
    for (const char *share : kShares) {
        Compare("a queue differs", ReadWhole(QueueOf(share)), model.queues[share]);
    }
    Compare("the commands differ", TakeCommands(), std::exchange(model.commands, {}));
}

}  // namespace

void FeedOperations(Input &input) {
    Model model;
    while (!input.IsEmpty()) {
        const std::size_t operation = input.Below(12);
        Require(Step(input, model, operation), "the answer differs", std::to_string(operation));
        CompareAll(model);
    }
}

}  // namespace fileindex_fuzz
