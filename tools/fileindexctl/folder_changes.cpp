#include "failure.h"
#include "folder_operations.h"
#include "folder_text.h"
#include "handlers.h"
#include "paths.h"
#include "steps.h"
#include "text.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>

#include <vork/search.h>

#include <algorithm>

namespace fileindexctl {

namespace {

using VORK::FILEINDEX::Folder;
using VORK::FILEINDEX::IndexMgr;

constexpr std::string_view kIndexMgr = "index_mgr.cpp";

std::vector<PlannedStep> UpsertPlan() {
    return {
        SaveStep(),
        {"monitor", "the file-change monitor could not be registered", {{kIndexMgr, 598}}},
        {"service", "fileindexd could not be started", {{kIndexMgr, 605}}},
        {"search setting", "the search setting did not take effect", {}, {{kIndexMgr, 611}, {kIndexMgr, 613}}},
        {"daemon told", "fileindexd cannot be reached", {{kIndexMgr, 621}}},
        {"events queued", "the event could not be queued", {{kIndexMgr, 629}, {kIndexMgr, 634}}},
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

ExitStatus Upsert(const Json::Value &record, Patience patience, Output &output) {
    const std::string path = record["path"].asString();
    Json::Value request(Json::arrayValue);
    request.append(record);
    const StepReport report = PerformUpsert(request, patience);
    report.Show(output);
    StateFolder(path, output);
    if (report.Status() != ExitStatus::Done) {
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

StepReport PerformUpsert(const Json::Value &records, Patience &patience) {
    const bool searchWasOn = VORKSMBIsEnableSpotlight() != 0;
    StepReport report = StepReport::Perform(UpsertPlan(), VORK::FILEINDEX::Folders(), patience,
                                            [&] { return IndexMgr::Upsert(records); });
    if (searchWasOn) {
        report.Correct("search setting", StepResult::Already);
    }
    MarkDroppedEvents(report);
    return report;
}

ExitStatus AddFolder(const Arguments &arguments, Output &output) {
    const Patience patience(arguments);
    const Folders folders = ReadFolders();
    Json::Value record(Json::objectValue);
    const std::string path = RequirePlain(arguments.One("PATH"), folders).path;
    if (std::any_of(folders.begin(), folders.end(), [&](const Folder &folder) { return folder.path == path; })) {
        throw Failure(ExitStatus::Usage, "\"" + path + "\" is indexed already; \"fileindexctl set\" changes it");
    }
    record["path"] = path;
    record["name"] = arguments.Has("--name") ? arguments.One("--name") : path.substr(path.rfind('/') + 1);
    SetMedia(record, arguments.Has("--media") ? arguments.One("--media") : "all");
    WarnOfNesting(path, folders, output);
    if (!VORK::FILEINDEX::CanPathBeIndexed(path)) {
        output.Warn(Quoted(path) + " cannot be indexed at present; \"fileindexctl explain " + ShellWord(path) +
                    "\" says why");
    }
    return Upsert(record, patience, output);
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
    return Upsert(record, patience, output);
}

}  // namespace fileindexctl
