// "check", "contains" and "governs".
#include "facts/kinds.h"
#include "facts/rules.h"
#include "report/folder_text.h"
#include "verbs/verb.h"

#include <fileindex/paths.h>

#include <cerrno>

namespace VORK::FILEINDEXCTL {

namespace {

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

ExitStatus Answer(bool yes, const std::string &answer, const Place &place, Output &output) {
    output.Line((place.path.empty() ? "/" : place.path) + ": " + answer + " (" + place.TakenAs() + ")");
    return yes ? ExitStatus::kDone : ExitStatus::kNo;
}

// Why the path is not in the index; empty when it is.
std::string Obstacle(const Place &place, const Json::Value &record, std::string &kind) {
    if (record.empty()) {
        return place.fullPath.empty() ? "its share is away" : "it lies in no indexed folder";
    }
    const std::string folder = record["path"].asString();
    std::string fullPath;
    FILEINDEX::GetFullPath(fullPath, folder);
    if (const auto found = FirstUnreachable(place.fullPath); found && found->error == EACCES) {
        throw Denied(found->part);
    }
    const Verdict verdict = Judge({folder, false, folder, fullPath});
    if (!verdict.indexable) {
        const RuleOutcome *failed = verdict.Failed();
        return folder + " may not be indexed" + (failed != nullptr ? ": " + failed->fact : "");
    }
    const std::string obstacle = ObstacleTo(place.fullPath, fullPath);
    return obstacle.empty() ? ObstacleOfKind(place.fullPath, record, kind) : obstacle;
}

}  // namespace

ExitStatus CheckPath(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Place place = Asked(arguments, folders, output);
    const Json::Value record = FILEINDEX::GetMostSuitableCfg(folders, place.fullPath);
    std::string kind;
    const std::string obstacle = Obstacle(place, record, kind);
    const bool indexed = obstacle.empty();
    auto &data = output.Data();
    data["indexed"] = indexed;
    data["reason"] = OrNull(obstacle);
    data["kind"] = OrNull(kind);
    data["covered_by"] = ToArray(Covering(AsFullPath(place), folders));
    const std::string how = kind.empty() ? "" : kind == kOtherKind ? " by its name" : " as " + kind;
    return Answer(indexed,
                  indexed ? "indexed" + how + " with " + record["path"].asString() : "not indexed: " + obstacle,
                  place, output);
}

ExitStatus ContainsFolder(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Place place = Asked(arguments, folders, output);
    const auto contained = Contained(place, folders);
    const bool any = place.isFull ? !contained.empty() : IndexMgr::IsPathContainIndexed(place.path, folders);
    output.Data()["contains"] = any;
    output.Data()["folders"] = ToArray(contained);
    return Answer(any, any ? "contains " + Enumerate(contained) : "contains no indexed folder", place, output);
}

ExitStatus GoverningFolder(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Place place = Asked(arguments, folders, output);
    const bool covered = place.isFull ? IndexMgr::IsFullPathIndexed(place.path, folders)
                                      : IndexMgr::IsPathIndexed(place.path, folders);
    if (place.fullPath.empty() && !place.isFull && !covered) {
        RequireShare(ShareOf(place.path));
    }
    const auto covering = Covering(place, folders);
    const Json::Value record = FILEINDEX::GetMostSuitableCfg(folders, place.fullPath);
    const bool governed = !record.empty();
    auto &data = output.Data();
    data["covered"] = covered;
    data["covered_by"] = ToArray(covering);
    data["governed"] = governed;
    data["folder"] = governed ? record : Json::Value();
    const auto alsoCovering = Covering(AsFullPath(place), folders);
    if (!covered && !alsoCovering.empty()) {
        output.Warn("as a full path, \"" + place.fullPath + "\" lies in " + Enumerate(alsoCovering) +
                    ": one share is inside another");
    }
    std::string answer = "covered by " + (covered ? Enumerate(covering) : "no indexed folder");
    if (governed) {
        answer += ", governed by " + record["path"].asString() + ": " + MediaText(record);
    } else if (covered) {
        answer += ", whose share is away";
    }
    return Answer(governed || covered, answer, place, output);
}

}  // namespace VORK::FILEINDEXCTL
