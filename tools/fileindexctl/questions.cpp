#include "folder_text.h"
#include "handlers.h"
#include "paths.h"
#include "text.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>

namespace fileindexctl {

namespace {

using VORK::FILEINDEX::IndexMgr;

ExitStatus Answer(bool yes) {
    return yes ? ExitStatus::Done : ExitStatus::No;
}

// Every answer says which kind of path the question was taken to be about.
Place Asked(const Arguments &arguments, const Folders &folders, Output &output) {
    Place place = Locate(arguments.One("PATH"), folders);
    output.Data()["path"] = place.path;
    output.Data()["taken_as"] = place.TakenAs();
    if (!IsPlain(place.path)) {
        output.Warn(Quoted(place.path) + " is compared as text: \".\", \"..\" and doubled \"/\" are not resolved");
    }
    return place;
}

void Say(const Place &place, const std::string &answer, Output &output) {
    output.Line(Printable((place.path.empty() ? "/" : place.path) + ": " + answer + " (" + place.TakenAs() + ")"));
}

}  // namespace

ExitStatus CheckPath(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Place place = Asked(arguments, folders, output);
    const bool indexed = place.isFull ? IndexMgr::IsFullPathIndexed(place.path, folders)
                                      : IndexMgr::IsPathIndexed(place.path, folders);
    const auto covering = Covering(place, folders);
    output.Data()["indexed"] = indexed;
    output.Data()["covered_by"] = ToArray(covering);
    const auto alsoCovering = Covering(AsFullPath(place), folders);
    if (!indexed && !alsoCovering.empty()) {
        output.Warn("as a full path, \"" + place.fullPath + "\" lies in " + Enumerate(alsoCovering) +
                    ": one share is inside another");
    }
    Say(place, indexed ? "indexed, covered by " + Enumerate(covering) : "not indexed", output);
    return Answer(indexed);
}

ExitStatus ContainsFolder(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Place place = Asked(arguments, folders, output);
    const auto contained = Contained(place, folders);
    const bool any = place.isFull ? !contained.empty() : IndexMgr::IsPathContainIndexed(place.path, folders);
    output.Data()["contains"] = any;
    output.Data()["folders"] = ToArray(contained);
    Say(place, any ? "contains " + Enumerate(contained) : "contains no indexed folder", output);
    return Answer(any);
}

ExitStatus GoverningFolder(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Place place = Asked(arguments, folders, output);
    if (place.fullPath.empty() && !place.isFull) {
        RequireShare(ShareOf(place.path));
    }
    const Json::Value record = VORK::FILEINDEX::GetMostSuitableCfg(folders, place.fullPath);
    const bool governed = !record.empty();
    output.Data()["governed"] = governed;
    output.Data()["folder"] = governed ? record : Json::Value();
    Say(place,
        governed ? "governed by " + record["path"].asString() + ": " + MediaText(record)
                 : "governed by no indexed folder",
        output);
    return Answer(governed);
}

}  // namespace fileindexctl
