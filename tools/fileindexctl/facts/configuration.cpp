#include "facts/configuration.h"

#include "base/has_nul.h"
#include "base/json/document.h"
#include "base/json/text.h"
#include "facts/paths.h"
#include "facts/status_file.h"
#include "report/failure.h"
#include "report/folder_text.h"
#include "report/text.h"

#include <algorithm>
#include <ctime>
#include <iterator>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr int kVersion = 1;
constexpr long long kNotPaused = -1;

// A pause that is over reads as none.
long long InEffect(long long resumeTime) {
    return resumeTime != 0 && resumeTime <= std::time(nullptr) ? kNotPaused : resumeTime;
}

Json::Value Flags(const std::set<std::string> &names) {
    Json::Value flags(Json::objectValue);
    for (const auto &name : names) {
        flags[name] = true;
    }
    return flags;
}

std::string Member(const std::string &parent, const std::string &name) {
    return parent + "[" + Quoted(name) + "]";
}

// The checks, each of which names the member at fault.
class Checker {
public:
    explicit Checker(const std::string &source) : source_(source) {}

    [[noreturn]] void Fault(const std::string &member, const std::string &what) const {
        throw Failure(ExitStatus::kMalformed, source_ + ": " + (member.empty() ? "" : member + ": ") + what);
    }

    void RequireObject(const Json::Value &value, const std::string &member) const {
        if (!value.isObject()) {
            Fault(member, "an object is expected");
        }
    }

    Json::Value Parse(const std::string &text) const {
        std::string problems;
        auto document = ParseStrictly(text, &problems);
        if (!document && problems.empty()) {
            Fault({}, "it is nested more deeply than " + std::to_string(kMaxJsonDepth) + " levels");
        }
        if (!document) {
            std::replace(problems.begin(), problems.end(), '\n', ' ');
            Fault({}, "this is no JSON: " + problems.substr(0, problems.find_last_not_of(' ') + 1));
        }
        return std::move(*document);
    }

    FolderRecords Folders(const Json::Value &folders) const {
        RequireObject(folders, "folder");
        FolderRecords records;
        for (const auto &path : folders.getMemberNames()) {
            records[path] = Record(path, folders[path], Member("folder", path));
        }
        return records;
    }

    StatusSettings Status(const Json::Value &status) const {
        RequireObject(status, "status");
        StatusSettings settings;
        for (const auto &name : status.getMemberNames()) {
            const std::string member = Member("status", name);
            if (name == "resume_time") {
                settings.resumeTime = InEffect(Time(status[name], member));
            } else if (name == "no_space") {
                settings.noSpace = Set(status[name], member);
            } else if (name == "need_reindex") {
                settings.needReindex = Set(status[name], member);
            } else if (Boolean(status[name], member)) {
                settings.markers.insert(name);
            }
        }
        return settings;
    }

private:
    bool Boolean(const Json::Value &value, const std::string &member) const {
        if (!value.isBool()) {
            Fault(member, "true or false is expected");
        }
        return value.asBool();
    }

    std::string Text(const Json::Value &value, const std::string &member) const {
        if (!value.isString()) {
            Fault(member, "a text is expected");
        }
        return value.asString();
    }

    long long Time(const Json::Value &value, const std::string &member) const {
        if (!value.isInt64() || value.asInt64() < kNotPaused) {
            Fault(member, "-1, 0 or a time is expected");
        }
        return value.asInt64();
    }

    // false is taken at its word here; the files themselves never hold it.
    std::set<std::string> Set(const Json::Value &value, const std::string &member) const {
        RequireObject(value, member);
        std::set<std::string> names;
        for (const auto &name : value.getMemberNames()) {
            if (Boolean(value[name], Member(member, name))) {
                names.insert(name);
            }
        }
        return names;
    }

    // What is absent is empty or false, as in folder.conf.
    Json::Value Record(const std::string &path, const Json::Value &given, const std::string &member) const {
        RequireObject(given, member);
        if (path.empty() || path.front() != '/' || HasNul(path)) {
            Fault(member, "a share path is expected: it begins with \"/\" and a share's name");
        }
        Json::Value record = VORK::FILEINDEX::Folder().asJson();
        record["path"] = path;
        for (const auto &name : given.getMemberNames()) {
            const std::string place = Member(member, name);
            if (name == "path" && Text(given[name], place) != path) {
                Fault(place, "it differs from the name of the record");
            } else if (name == "name") {
                record[name] = Text(given[name], place);
            } else if (std::find(std::begin(kMediaKinds), std::end(kMediaKinds), name) != std::end(kMediaKinds)) {
                record[name] = Boolean(given[name], place);
            } else if (name != "path") {
                Fault(place, "there is no such member");
            }
        }
        return record;
    }

    const std::string &source_;
};

}  // namespace

FolderRecords StoredFolders() {
    FolderRecords records;
    for (const auto &folder : ReadFolders()) {
        records[folder.path] = folder.asJson();
    }
    return records;
}

StatusSettings StoredStatus() {
    StatusFile file;
    const long long resumeTime = file.LoadPause();
    return {InEffect(resumeTime), file.Marked("no_space"), file.Marked("need_reindex"), file.Markers()};
}

Json::Value DocumentOf(const FolderRecords &folders, const StatusSettings &status) {
    Json::Value document(Json::objectValue);
    document["version"] = kVersion;
    document["folder"] = Json::Value(Json::objectValue);
    for (const auto &[path, record] : folders) {
        document["folder"][path] = record;
    }
    document["status"] = Flags(status.markers);
    document["status"]["resume_time"] = static_cast<Json::Int64>(status.resumeTime);
    document["status"]["no_space"] = Flags(status.noSpace);
    document["status"]["need_reindex"] = Flags(status.needReindex);
    return document;
}

Configuration ParseConfiguration(const std::string &text, const std::string &source) {
    const Checker checker(source);
    Json::Value document = checker.Parse(text);
    checker.RequireObject(document, {});
    if (document.isMember("schema") && document.isMember("data")) {  // what "export --json" writes
        const Json::Value data = document["data"];
        checker.RequireObject(data, "data");
        document = data;
    }
    if (document["version"] != kVersion) {
        checker.Fault("version", "1 is expected");
    }
    Configuration configuration;
    for (const auto &name : document.getMemberNames()) {
        if (name == "folder") {
            configuration.folders = checker.Folders(document[name]);
        } else if (name == "status") {
            configuration.status = checker.Status(document[name]);
        } else if (name != "version") {
            checker.Fault(name, "there is no such member");
        }
    }
    return configuration;
}

}  // namespace VORK::FILEINDEXCTL
