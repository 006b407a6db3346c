// "explain": why a path is indexed, or not.
#include "command_line/handlers.h"
#include "facts/kinds.h"
#include "facts/paths.h"
#include "facts/queue.h"
#include "facts/rules.h"
#include "facts/status_file.h"
#include "report/failure.h"
#include "report/folder_text.h"
#include "report/schedule.h"
#include "report/text.h"

#include <fileindex/folders.h>
#include <fileindex/indexability.h>
#include <fileindex/paths.h>
#include <fileindex/status_mgr.h>

#include <sys/stat.h>

#include <algorithm>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::StatusMgr;

struct ShareFlags {
    std::string name{};
    bool noSpace = false;      // marked
    bool hasRoom = true;       // measured
    bool needReindex = false;  // marked
    bool areMarksKnown = true;
};

struct Explanation {
    Place place;
    Verdict verdict;
    std::vector<std::string> covering{};
    Json::Value governing{};   // the record; null when there is none
    std::string passedOver{};  // the first part of the path that the indexer passes over
    std::string kind{};        // of a file
    std::string kindOff{};     // why that keeps it out of the governing folder
    std::optional<Backlog> backlog{};
    std::string queueTrouble{};            // why there is none
    std::vector<std::string> reindexed{};  // full paths above the place whose reindex is queued
    ShareFlags share{};
    bool isPauseKnown = false;
    long long resumeTime = -1;
};

// Is the first component of the path there?
bool IsRootEntry(const std::string &path) {
    struct stat status {};
    return path.empty() || lstat(path.substr(0, path.find('/', 1)).c_str(), &status) == 0;
}

// A folder may be stored with a "/" at its end, which is then a reason for its not being indexed.
Place PlaceToExplain(const std::string &given, const Folders &folders) {
    Place place = Locate(given, folders);
    if (place.isFull && place.sharePath.empty() && !IsRootEntry(place.path)) {
        place = {place.path, false, place.path, {}};  // a share that is unknown, or cannot be used
        VORK::FILEINDEX::GetFullPath(place.fullPath, place.path);
    }
    const bool stored =
        std::any_of(folders.begin(), folders.end(), [&](const auto &folder) { return folder.path == given; });
    const std::string tail = given.substr(place.path.size());
    if (place.path.empty() || (stored && !place.isFull)) {
        place.path += tail;
        place.fullPath += place.fullPath.empty() && !place.isFull ? "" : tail;
    }
    return place;
}

ShareFlags FlagsOf(const std::string &share) {
    ShareFlags flags{share};
    if (!share.empty()) {
        StatusFile status;
        flags.areMarksKnown = status.Load() && (status.Document().isObject() || status.Document().isNull());
        flags.noSpace = StatusMgr::ShareIsNoSpace(share);
        flags.needReindex = StatusMgr::ShareIsNeedReindex(share);
        flags.hasRoom = !IsSharePresent(share) || VORK::FILEINDEX::IsShareSpaceEnough(share);
    }
    return flags;
}

void AddQueued(const std::string &share, const std::string &top, Explanation &explanation) {
    const std::string &path = explanation.place.fullPath;
    try {
        explanation.backlog = ReadBacklog(share, path);
    } catch (const Failure &failure) {
        explanation.queueTrouble = failure.what();  // the rest of the explanation does not need it
        return;
    }
    for (const auto &outer : DownFrom(top, path)) {
        if (outer != path && IsReindexQueued(share, outer)) {
            explanation.reindexed.push_back(outer);
        }
    }
}

std::string TopOf(const std::vector<std::string> &covering, const std::string &fullPath, const Folders &folders) {
    std::string top = fullPath;
    for (const auto &folder : folders) {
        const bool covers = std::find(covering.begin(), covering.end(), folder.path) != covering.end();
        const std::string path = covers ? folder.GetFullPath() : std::string();
        top = covers && path.size() < top.size() ? path : top;
    }
    return top;
}

Explanation Look(const Place &place, const Folders &folders) {
    Explanation explanation{place, Judge(place)};
    const Place full = AsFullPath(place);
    explanation.covering = Covering(full, folders);
    if (!place.fullPath.empty()) {
        const Json::Value record = VORK::FILEINDEX::GetMostSuitableCfg(folders, place.fullPath);
        explanation.governing = record.empty() ? Json::Value() : record;
    }
    const std::string share = ShareOf(place.sharePath);
    const std::string top = TopOf(explanation.covering, place.fullPath, folders);
    if (!place.fullPath.empty()) {
        std::string folder = place.fullPath;
        if (!explanation.governing.isNull()) {
            VORK::FILEINDEX::GetFullPath(folder, explanation.governing["path"].asString());
        }
        explanation.passedOver = FirstPassedOver(folder, place.fullPath);
        if (explanation.verdict.indexable && !explanation.governing.isNull()) {
            explanation.kindOff = ObstacleOfKind(place.fullPath, explanation.governing, explanation.kind);
        }
    }
    if (!place.fullPath.empty() && !share.empty()) {
        AddQueued(share, top, explanation);
    }
    explanation.share = FlagsOf(share);
    explanation.isPauseKnown = StatusMgr::GetPauseInfo(explanation.resumeTime);
    return explanation;
}

// The one thing to do next; empty when nothing stands in the way.
std::string RemedyFor(const Explanation &explanation) {
    const std::string share = ShellWord(explanation.share.name);
    if (const RuleOutcome *failed = explanation.verdict.Failed()) {
        return failed->remedy;
    }
    if (!explanation.verdict.indexable) {
        return "repeat the question; if the answer stays, see the system log";
    }
    if (!explanation.passedOver.empty()) {
        return "keep files to be indexed elsewhere: the indexer does not go into " +
               Quoted(explanation.passedOver);
    }
    if (explanation.covering.empty()) {
        return "\"fileindexctl add " + ShellWord(explanation.place.sharePath) + "\" has it indexed";
    }
    if (!explanation.kindOff.empty()) {
        return explanation.kindOff + "; \"fileindexctl set " +
               ShellWord(explanation.governing["path"].asString()) + " --media\" changes what is indexed";
    }
    if (!explanation.share.hasRoom) {
        return "make room on the volume of the share (10 MiB), then \"fileindexctl revive " + share + "\"";
    }
    if (!explanation.share.areMarksKnown) {
        return "\"fileindexctl doctor\" tells what is wrong with the status file";
    }
    if (explanation.share.noSpace) {
        return "\"fileindexctl revive " + share + "\", as there is room again";
    }
    if (explanation.share.needReindex) {
        return "\"fileindexctl reindex " + ShellWord(explanation.covering.front()) + "\"";
    }
    const bool paused = explanation.isPauseKnown && IsPaused(explanation.resumeTime);
    return paused ? "\"fileindexctl resume\", or wait for the end of the pause" : "";
}

std::string QueuedText(const Explanation &explanation) {
    if (!explanation.queueTrouble.empty()) {
        return explanation.queueTrouble;
    }
    if (!explanation.backlog) {
        return explanation.share.name.empty() ? "nothing: the path is in no share" : "the share is away";
    }
    std::string text = BacklogText(*explanation.backlog);
    if (!explanation.reindexed.empty()) {
        text += "; covered by the queued reindex of " + Enumerate(explanation.reindexed);
    }
    return text;
}

std::string KindText(const Explanation &explanation) {
    const std::string kind = explanation.kind.empty() ? "no file" : explanation.kind;
    return explanation.kindOff.empty() ? kind : explanation.kindOff;
}

std::string FlagsText(const ShareFlags &flags) {
    if (flags.name.empty()) {
        return "none";
    }
    std::vector<std::string> items;
    if (flags.noSpace || !flags.hasRoom) {
        items.emplace_back(!flags.hasRoom ? flags.noSpace ? "out of space" : "out of space, though not marked so"
                                          : "marked as out of space, though there is room");
    }
    if (flags.needReindex) {
        items.emplace_back("waiting for a reindex");
    }
    if (!flags.areMarksKnown) {
        items.emplace_back("its marks cannot be told");
    }
    return flags.name + (items.empty() ? "" : ": " + Enumerate(items));
}

std::string Wording(RuleResult result) {
    switch (result) {
        case RuleResult::kPassed:
            return "passed";
        case RuleResult::kFailed:
            return "FAILED";
        case RuleResult::kNotReached:
            break;
    }
    return "not reached";
}

void ShowFacts(const Explanation &explanation, Output &output) {
    const Place &place = explanation.place;
    const RuleOutcome *failed = explanation.verdict.Failed();
    const std::string reason = failed != nullptr ? ": " + failed->fact : "";
    const Json::Value &governing = explanation.governing;
    const std::string settings =
        governing.isNull() ? "no indexed folder" : governing["path"].asString() + ": " + MediaText(governing);
    const std::string otherPath = place.isFull ? place.sharePath : place.fullPath;
    const auto lines = Align(
        {{"path", place.path + " (" + place.TakenAs() + ")"},
         {place.isFull ? "share path" : "full path", otherPath.empty() ? "none" : otherPath},
         {"indexable", explanation.verdict.indexable ? "yes" : "no" + reason},
         {"covered by", explanation.covering.empty() ? "no indexed folder" : Enumerate(explanation.covering)},
         {"governed by", settings},
         {"kind", KindText(explanation)},
         {"passed over", explanation.passedOver.empty() ? "no" : "yes, at " + explanation.passedOver},
         {"queued", QueuedText(explanation)},
         {"share", FlagsText(explanation.share)},
         {"pause", explanation.isPauseKnown ? PauseText(explanation.resumeTime) : "cannot be told"}},
        0);
    for (const auto &line : lines) {
        output.Line(line);
    }
}

void ShowRules(const Verdict &verdict, Output &output) {
    static constexpr Colour kColours[] = {Colour::kGood, Colour::kBad, Colour::kDim};
    std::vector<std::vector<std::string>> rows = {{"RULE", "RESULT", "FACT"}};
    for (const auto &rule : verdict.rules) {
        rows.push_back({std::string(rule.label), Wording(rule.result), rule.fact});
    }
    const auto lines = Align(rows, 0);
    output.Line("");
    output.Line(lines.front());
    for (std::size_t i = 0; i < verdict.rules.size(); ++i) {
        output.Line(lines[i + 1], kColours[static_cast<int>(verdict.rules[i].result)]);
    }
}

Json::Value RulesJson(const Verdict &verdict) {
    static constexpr const char *kResults[] = {"passed", "failed", "not_reached"};
    Json::Value rules(Json::arrayValue);
    for (const auto &rule : verdict.rules) {
        Json::Value entry(Json::objectValue);
        entry["rule"] = std::string(rule.key);
        entry["result"] = kResults[static_cast<int>(rule.result)];
        entry["fact"] = rule.fact;
        rules.append(entry);
    }
    return rules;
}

Json::Value Text(const std::string &text) {
    return text.empty() ? Json::Value() : Json::Value(text);
}

void FillData(const Explanation &explanation, const std::string &remedy, Json::Value &data) {
    const RuleOutcome *failed = explanation.verdict.Failed();
    data["path"] = explanation.place.path;
    data["taken_as"] = explanation.place.TakenAs();
    data["share_path"] = Text(explanation.place.sharePath);
    data["full_path"] = Text(explanation.place.fullPath);
    data["indexable"] = explanation.verdict.indexable;
    data["explained"] = explanation.verdict.explained;
    data["failed_rule"] = failed != nullptr ? Json::Value(std::string(failed->key)) : Json::Value();
    data["rules"] = RulesJson(explanation.verdict);
    data["remedy"] = Text(remedy);
    data["covered_by"] = ToArray(explanation.covering);
    data["governed_by"] = explanation.governing;
    data["kind"] = Text(explanation.kind);
    data["kind_off"] = Text(explanation.kindOff);
    data["passed_over"] = Text(explanation.passedOver);
    data["queue"] = explanation.backlog ? BacklogJson(*explanation.backlog) : Json::Value();
    data["reindexed_with"] = ToArray(explanation.reindexed);
    const auto mark = [&](bool set) { return explanation.share.areMarksKnown ? Json::Value(set) : Json::Value(); };
    auto &share = data["share"];
    if (!explanation.share.name.empty()) {
        share["name"] = explanation.share.name;
        share["no_space"] = mark(explanation.share.noSpace);
        share["has_room"] = explanation.share.hasRoom;
        share["need_reindex"] = mark(explanation.share.needReindex);
    }
    data["resume_time"] =
        explanation.isPauseKnown ? Json::Value(static_cast<Json::Int64>(explanation.resumeTime)) : Json::Value();
}

}  // namespace

ExitStatus ExplainPath(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Explanation explanation = Look(PlaceToExplain(arguments.One("PATH"), folders), folders);
    const std::string remedy = RemedyFor(explanation);
    FillData(explanation, remedy, output.Data());
    ShowFacts(explanation, output);
    ShowRules(explanation.verdict, output);
    if (!explanation.verdict.explained) {
        output.Warn("the rules as they look now do not explain the library's answer, \"" +
                    std::string(explanation.verdict.indexable ? "yes" : "no") +
                    "\", which is the one that counts; something may be changing");
    }
    if (!remedy.empty()) {
        output.Line("");
        output.Line(Printable("remedy: " + remedy));
    }
    return explanation.verdict.indexable ? ExitStatus::kDone : ExitStatus::kNo;
}

}  // namespace VORK::FILEINDEXCTL
