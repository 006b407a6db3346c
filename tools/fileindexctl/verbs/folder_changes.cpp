#include "facts/registrations.h"
#include "facts/rules.h"
#include "report/confirm.h"
#include "report/folder_text.h"
#include "verbs/folder_operations.h"

#include <cerrno>

namespace VORK::FILEINDEXCTL {

namespace {

// What is stored now, whoever stored it.
void StateFolder(const std::string &path, Output &output) {
    Folders folders;
    IndexMgr::List(folders);
    const Folder *found = FindFolder(path, folders);
    const Json::Value record = found != nullptr ? found->asJson() : Json::Value();
    output.Data()["folder"] = record;
    output.Line(path + (found != nullptr ? " is indexed as " + Quoted(found->name) + ": " + MediaText(record)
                                         : " is not indexed"));
}

ExitStatus Upsert(const Json::Value &record, const Folders &folders, Patience &patience, Output &output) {
    const std::string path = record["path"].asString();
    WarnOfResumption({ShareOf(path)}, SharesOf(folders), output);
    AnnounceRestart(RestartWith(true, false), output);
    Json::Value request(Json::arrayValue);
    request.append(record);
    const StepReport report = PerformUpsert(request, patience);
    report.Show(output);
    StateFolder(path, output);
    const std::string word = ShellWord(path);
    // A repeated change finds nothing changed any more, so the daemon is asked to look at everything.
    return output.Conclude(report.Status(),
                           "the change is saved, but not everybody knows; once the cause is mended: "
                           "\"fileindexctl set " +
                               word + "\", then \"fileindexctl reindex " + word + "\"");
}

void WarnOfNesting(const std::string &path, const Folders &folders, Output &output) {
    const Place place = AsFullPath(Locate(path, folders));
    for (const auto &other : Covering(place, folders)) {
        output.Warn(Quoted(path) + " lies in the indexed folder " + Quoted(other) + " already");
    }
    for (const auto &other : Contained(place, folders)) {
        output.Warn(Quoted(path) + " covers the indexed folder " + Quoted(other));
    }
}

// A folder that is yet to come can be added all the same.
void RequireThere(const std::string &fullPath, bool isForced) {
    const auto trouble = WhyNoFolder(fullPath);
    const auto missing = FirstUnreachable(fullPath);
    const bool isToCome = isForced && missing && missing->error != ENAMETOOLONG;
    if (trouble && !isToCome) {
        const bool mayCome = trouble->Status() == ExitStatus::kNoSuchFolder;
        throw Failure(trouble->Status(),
                      trouble->what() + std::string(mayCome ? "; --force adds a folder that is yet to come" : ""));
    }
}

Paths Requested(const Arguments &arguments, const Folders &folders, Output &output) {
    Paths paths;
    for (const auto &given : arguments.All("PATH")) {
        const std::string path = RequireFolder(given, folders).path;
        if (std::find(paths.begin(), paths.end(), path) != paths.end()) {
            output.Warn("\"" + path + "\" is given twice");
            continue;
        }
        paths.push_back(path);
    }
    const auto away = FirstAway(paths);
    if (away != paths.end() && !arguments.Has("--force")) {
        throw Failure(ExitStatus::kUsage,
                      "the share of \"" + *away +
                          "\" is away, so its monitor and its index data would be left behind; "
                          "--force removes the folder all the same");
    }
    return paths;
}

void StateRest(const Paths &removed, Output &output) {
    Folders folders;
    IndexMgr::List(folders);
    auto &data = output.Data()["removed"] = Json::Value(Json::arrayValue);
    for (const auto &path : removed) {
        if (FindFolder(path, folders) == nullptr) {
            data.append(path);
        }
        const auto covering = Covering(Locate(path, folders), folders);
        output.Line(path + (covering.empty() ? " is not indexed" : " still lies in " + Enumerate(covering)));
    }
    StateTotal(folders.size(), output);
}

}  // namespace

ExitStatus AddFolder(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const Folders folders = ReadFolders();
    const Place place = RequirePlain(arguments.One("PATH"), folders);
    const std::string &path = place.path;
    if (FindFolder(path, folders) != nullptr) {
        throw Failure(ExitStatus::kUsage, "\"" + path + "\" is indexed already; \"fileindexctl set\" changes it");
    }
    Json::Value record(Json::objectValue);
    SetMedia(record, arguments.Has("--media") ? arguments.One("--media") : "all");
    RequireThere(place.fullPath, arguments.Has("--force"));
    record["path"] = path;
    record["name"] = arguments.Has("--name") ? arguments.One("--name") : path.substr(path.rfind('/') + 1);
    WarnOfNesting(path, folders, output);
    WarnOfObstacle(path, place.fullPath, output);
    return Upsert(record, folders, patience, output);
}

ExitStatus SetFolder(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const Folders folders = ReadFolders();
    Json::Value record(Json::objectValue);
    record["path"] = RequireFolder(arguments.One("PATH"), folders).path;
    RequireShare(ShareOf(record["path"].asString()));
    if (arguments.Has("--name")) {
        record["name"] = arguments.One("--name");
    }
    if (arguments.Has("--media")) {
        SetMedia(record, arguments.One("--media"));
    }
    return Upsert(record, folders, patience, output);
}

ExitStatus RemoveFolders(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    const Folders folders = ReadFolders();
    Paths removed = Requested(arguments, folders, output);
    RequireConsent(arguments, ConsequenceOf(removed, folders));
    WarnOfResumption(SharesOf(removed), SharesOf(Without(folders, removed)), output);
    AnnounceRestart(RestartWith(false, removed.size() == folders.size()), output);
    const StepReport report = PerformRemoval("saved", removed, patience);
    report.Show(output);
    StateRest(removed, output);
    return output.Conclude(
        report.Status(),
        "the folders are removed, but not everybody knows; once the cause is mended: \"fileindexctl "
        "monitor refresh\", and \"fileindexctl share clean\" for a share without folders");
}

}  // namespace VORK::FILEINDEXCTL
