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

// A part of the document. Each check names the place at fault.
class Part {
public:
    Part(const std::string &source, const Json::Value &value, std::string place = {})
        : source_(source), value_(value), place_(std::move(place)) {}

    void Require(bool holds, const std::string &what) const {
        if (!holds) {
            throw Failure(ExitStatus::kMalformed, source_ + ": " + (place_.empty() ? "" : place_ + ": ") + what);
        }
    }

    Json::Value::Members Names() const {
        Require(value_.isObject(), "an object is expected");
        return value_.getMemberNames();
    }

    Part operator[](const std::string &name) const {
        return {source_, value_[name], place_.empty() ? name : place_ + "[" + Quoted(name) + "]"};
    }

    bool Boolean() const {
        Require(value_.isBool(), "true or false is expected");
        return value_.asBool();
    }

    std::string Text() const {
        Require(value_.isString(), "a text is expected");
        return value_.asString();
    }

    long long Time() const {
        Require(value_.isInt64() && value_.asInt64() >= kNotPaused, "-1, 0 or a time is expected");
        return value_.asInt64();
    }

    // false is taken at its word here; the files themselves never hold it.
    std::set<std::string> Set() const {
        std::set<std::string> names;
        for (const auto &name : Names()) {
            if ((*this)[name].Boolean()) {
                names.insert(name);
            }
        }
        return names;
    }

private:
    const std::string &source_;
    const Json::Value &value_;
    std::string place_;
};

// What is absent is empty or false, as in folder.conf.
Json::Value RecordOf(const std::string &path, const Part &given) {
    const auto names = given.Names();
    given.Require(path.starts_with('/') && !HasNul(path),
                  "a share path is expected: it begins with \"/\" and a share's name");
    Json::Value record = VORK::FILEINDEX::Folder().asJson();
    record["path"] = path;
    for (const auto &name : names) {
        const Part member = given[name];
        if (name == "path") {
            member.Require(member.Text() == path, "it differs from the name of the record");
        } else if (name == "name") {
            record[name] = member.Text();
        } else {
            member.Require(std::ranges::find(kMediaKinds, name) != std::end(kMediaKinds),
                           "there is no such member");
            record[name] = member.Boolean();
        }
    }
    return record;
}

FolderRecords FoldersOf(const Part &folders) {
    FolderRecords records;
    for (const auto &path : folders.Names()) {
        records[path] = RecordOf(path, folders[path]);
    }
    return records;
}

StatusSettings StatusOf(const Part &status) {
    StatusSettings settings;
    for (const auto &name : status.Names()) {
        const Part member = status[name];
        if (name == "resume_time") {
            settings.resumeTime = InEffect(member.Time());
        } else if (name == "no_space") {
            settings.noSpace = member.Set();
        } else if (name == "need_reindex") {
            settings.needReindex = member.Set();
        } else if (member.Boolean()) {
            settings.markers.insert(name);
        }
    }
    return settings;
}

Json::Value Parse(const std::string &text, const std::string &source) {
    std::string problems;
    auto document = ParseStrictly(text, &problems);
    if (document) {
        return std::move(*document);
    }
    std::replace(problems.begin(), problems.end(), '\n', ' ');
    problems.erase(problems.find_last_not_of(' ') + 1);
    throw Failure(ExitStatus::kMalformed, source + ": " +
                                              (problems.empty() ? "it is nested more deeply than " +
                                                                      std::to_string(kMaxJsonDepth) + " levels"
                                                                : "this is no JSON: " + problems));
}

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
    const Json::Value document = Parse(text, source);
    const Part whole(source, document);
    // "export --json" wraps it.
    const bool isWrapped = document.isObject() && document.isMember("schema") && document.isMember("data");
    (isWrapped ? whole["data"] : whole).Names();  // throws unless it is an object
    const Json::Value &values = isWrapped ? document["data"] : document;
    const Part content(source, values);
    content["version"].Require(values["version"] == kVersion, "1 is expected");
    Configuration configuration;
    for (const auto &name : content.Names()) {
        if (name == "folder") {
            configuration.folders = FoldersOf(content[name]);
        } else if (name == "status") {
            configuration.status = StatusOf(content[name]);
        } else {
            content[name].Require(name == "version", "there is no such member");
        }
    }
    return configuration;
}

}  // namespace VORK::FILEINDEXCTL
