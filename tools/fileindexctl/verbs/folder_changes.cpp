#include "command_line/handlers.h"
#include "facts/paths.h"
#include "facts/registrations.h"
#include "facts/rules.h"
#include "facts/system_services.h"
#include "report/failure.h"
#include "report/folder_text.h"
#include "report/steps.h"
#include "report/text.h"
#include "verbs/folder_operations.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>

#include <vork/filesystem.h>
#include <vork/search.h>

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::IndexMgr;

std::vector<PlannedStep> UpsertPlan(const std::set<std::string> &shares) {
    return {
        SaveStep(),
        {"monitor", "the file-change monitor could not be registered", {{records::kUpsertMonitor}}},
        {"service", "fileindexd could not be started", {{records::kUpsertStart}}},
        {"search setting",
         "the search setting did not take effect",
         {},
         {{records::kUpsertSearch}, {records::kUpsertRestart}}},
        {"daemon told", "fileindexd cannot be reached", {{records::kUpsertSend}}},
        {"events queued",
         "the event could not be queued",
         {{records::kUpsertPath}, {records::kUpsertEvent}},
         {},
         Evidence::kRecord,
         shares},
    };
}

// What is stored now, whoever stored it.
void StateFolder(const std::string &path, Output &output) {
    Folders folders;
    IndexMgr::List(folders);
    const auto found =
        std::find_if(folders.begin(), folders.end(), [&](const Folder &folder) { return folder.path == path; });
    if (found == folders.end()) {
        output.Data()["folder"] = Json::Value();
        output.Line(Printable(path) + " is not indexed");
        return;
    }
    const Json::Value record = found->asJson();
    output.Data()["folder"] = record;
    output.Line(Printable(path + " is indexed as \"" + found->name + "\": " + MediaText(record)));
}

ExitStatus Upsert(const Json::Value &record, const Folders &folders, Patience patience, Output &output) {
    const std::string path = record["path"].asString();
    WarnOfResumption({ShareOf(path)}, SharesOf(folders), output);
    AnnounceRestart(RestartWith(true, false), output);
    Json::Value request(Json::arrayValue);
    request.append(record);
    const StepReport report = PerformUpsert(request, patience);
    report.Show(output);
    StateFolder(path, output);
    if (report.Status() != ExitStatus::kDone) {
        const std::string word = ShellWord(path);
        // A repeated change finds nothing changed any more, so the daemon is asked to look at everything.
        output.Error(report.Status(),
                     "the change is saved, but not everybody knows; once the cause is mended: "
                     "\"fileindexctl set " +
                         word + "\", then \"fileindexctl reindex " + word + "\"");
    }
    return report.Status();
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

}  // namespace

std::optional<Failure> WhyNoFolder(const std::string &fullPath) {
    if (const auto found = FirstUnreachable(fullPath)) {
        if (found->error == ENAMETOOLONG) {
            return Failure(ExitStatus::kUsage, Quoted(found->part) + " is longer than a name or a path can be");
        }
        if (found->error != ENOENT && found->error != ENOTDIR) {
            return std::nullopt;
        }
        const std::string &part = found->part;
        const bool isPattern = part.find_first_of("*?[", part.rfind('/')) != std::string::npos;
        return Failure(isPattern ? ExitStatus::kUsage : ExitStatus::kNoSuchFolder,
                       "there is no " + Quoted(part) +
                           (isPattern ? ", and patterns are not looked up: name the folders one by one" : ""));
    }
    struct stat status {};
    const int type = VORKGetFSType(fullPath.c_str(), 0);  // a dead server is not asked what is there
    if (VORKFSIsRemoteFS(type) == 0 && stat(fullPath.c_str(), &status) == 0 && !S_ISDIR(status.st_mode)) {
        return Failure(ExitStatus::kUsage, Quoted(fullPath) + " is a file; folders are indexed");
    }
    return std::nullopt;
}

void WarnOfObstacle(const std::string &path, const std::string &fullPath, Output &output) {
    if (const auto trouble = WhyNoFolder(fullPath)) {
        output.Warn(Quoted(path) + " cannot be indexed at present: " + trouble->what());
    } else if (!VORK::FILEINDEX::CanPathBeIndexed(path)) {
        output.Warn(Quoted(path) + " cannot be indexed at present; \"fileindexctl explain " + ShellWord(path) +
                    "\" says why");
    } else if (const auto obstacle = ObstacleTo(fullPath, RequireShare(ShareOf(path))); !obstacle.empty()) {
        output.Warn(Quoted(path) + " is not indexed: " + obstacle);
    }
}

std::string RestartWith(bool savesFolders, bool leavesNone) {
    const bool isOn = VORKSMBIsEnableSpotlight() != 0;
    const bool isSwitched = isOn ? leavesNone : savesFolders;
    if (!isSwitched || !IsFileSharingThere()) {
        return "";
    }
    if (!isOn) {
        return "the file-sharing service will be restarted, because search is switched on";
    }
    return "the file-sharing service will be restarted, because no folder is left and search is switched off";
}

void AnnounceRestart(const std::string &restart, Output &output) {
    if (!restart.empty()) {
        output.Note(restart);
    }
}

StepReport PerformUpsert(const Json::Value &records, Patience &patience) {
    const bool searchWasOn = VORKSMBIsEnableSpotlight() != 0;
    std::set<std::string> shares;
    for (const auto &record : records) {
        shares.insert(ShareOf(record["path"].asString()));
    }
    StepReport report = StepReport::Perform(UpsertPlan(shares), VORK::FILEINDEX::Folders(), patience,
                                            [&] { return IndexMgr::Upsert(records); });
    if (searchWasOn) {
        report.Correct("search setting", StepResult::kAlready);
    }
    MarkDroppedEvents(report);
    return report;
}

ExitStatus AddFolder(const Arguments &arguments, Output &output) {
    const Patience patience(arguments);
    const Folders folders = ReadFolders();
    Json::Value record(Json::objectValue);
    const Place place = RequirePlain(arguments.One("PATH"), folders);
    const std::string &path = place.path;
    if (std::any_of(folders.begin(), folders.end(), [&](const Folder &folder) { return folder.path == path; })) {
        throw Failure(ExitStatus::kUsage, "\"" + path + "\" is indexed already; \"fileindexctl set\" changes it");
    }
    SetMedia(record, arguments.Has("--media") ? arguments.One("--media") : "all");
    const auto trouble = WhyNoFolder(place.fullPath);
    const auto missing = FirstUnreachable(place.fullPath);
    const bool isToCome = arguments.Has("--force") && missing && missing->error != ENAMETOOLONG;
    if (trouble && !isToCome) {
        throw Failure(trouble->Status(),
                      trouble->what() + std::string(trouble->Status() == ExitStatus::kNoSuchFolder
                                                        ? "; --force adds a folder that is yet to come"
                                                        : ""));
    }
    record["path"] = path;
    record["name"] = arguments.Has("--name") ? arguments.One("--name") : path.substr(path.rfind('/') + 1);
    WarnOfNesting(path, folders, output);
    WarnOfObstacle(path, place.fullPath, output);
    return Upsert(record, folders, patience, output);
}

ExitStatus SetFolder(const Arguments &arguments, Output &output) {
    const Patience patience(arguments);
    const Folders folders = ReadFolders();
    const Folder &folder = RequireFolder(arguments.One("PATH"), folders);
    RequireShare(ShareOf(folder.path));
    Json::Value record(Json::objectValue);
    record["path"] = folder.path;
    if (arguments.Has("--name")) {
        record["name"] = arguments.One("--name");
    }
    if (arguments.Has("--media")) {
        SetMedia(record, arguments.One("--media"));
    }
    return Upsert(record, folders, patience, output);
}

}  // namespace VORK::FILEINDEXCTL
