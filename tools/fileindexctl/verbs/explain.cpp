// "explain": why a path is indexed, or not.
#include "facts/kinds.h"
#include "facts/queue.h"
#include "facts/rules.h"
#include "facts/status_file.h"
#include "report/folder_text.h"
#include "report/schedule.h"
#include "verbs/verb.h"

#include <fileindex/indexability.h>
#include <fileindex/paths.h>

#include <sys/stat.h>

namespace VORK::FILEINDEXCTL {

namespace {

struct Explanation {
    Place place;
    Verdict verdict;
    Paths covering{};
    Json::Value governing{};   // the record; null when there is none
    std::string passedOver{};  // the first part of the path that the indexer passes over
    std::string kind{};        // of a file
    std::string kindOff{};     // why that keeps it out of the governing folder
    std::optional<Backlog> backlog{};
    std::string queueTrouble{};  // why there is none
    Paths reindexed{};           // full paths above the place whose reindex is queued
    std::string share{};
    bool noSpace = false;      // marked
    bool hasRoom = true;       // measured
    bool needReindex = false;  // marked
    bool areMarksKnown = true;
    std::optional<Json::Int64> resumeTime{};
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
        FILEINDEX::GetFullPath(place.fullPath, place.path);
    }
    const std::string tail = given.substr(place.path.size());
    if (place.path.empty() || (FindFolder(given, folders) != nullptr && !place.isFull)) {
        place.path += tail;
        place.fullPath += place.fullPath.empty() && !place.isFull ? "" : tail;
    }
    return place;
}

void AddGoverning(const Folders &folders, Explanation &explanation) {
    const std::string &fullPath = explanation.place.fullPath;
    const Json::Value record = FILEINDEX::GetMostSuitableCfg(folders, fullPath);
    if (record.empty()) {
        explanation.passedOver = FirstPassedOver(fullPath, fullPath);
        return;
    }
    std::string folder = fullPath;
    FILEINDEX::GetFullPath(folder, record["path"].asString());
    explanation.governing = record;
    explanation.passedOver = FirstPassedOver(folder, fullPath);
    if (explanation.verdict.indexable) {
        explanation.kindOff = ObstacleOfKind(fullPath, record, explanation.kind);
    }
}

// The full path of the outermost folder that covers the place, else its own.
std::string TopOf(const Explanation &explanation, const Folders &folders) {
    std::string top = explanation.place.fullPath;
    for (const auto &covering : explanation.covering) {
        const std::string path = FindFolder(covering, folders)->GetFullPath();
        top = path.size() < top.size() ? path : top;
    }
    return top;
}

void AddQueued(const Folders &folders, Explanation &explanation) {
    const std::string &path = explanation.place.fullPath;
    try {
        explanation.backlog = ReadBacklog(explanation.share, path);
    } catch (const Failure &failure) {
        explanation.queueTrouble = failure.what();  // the rest of the explanation does not need it
        return;
    }
    for (const auto &outer : DownFrom(TopOf(explanation, folders), path)) {
        if (outer != path && IsReindexQueued(explanation.share, outer)) {
            explanation.reindexed.push_back(outer);
        }
    }
}

void AddFlags(Explanation &explanation) {
    const std::string &share = explanation.share;
    StatusFile status;
    explanation.areMarksKnown = status.Load() && (status.Document().isObject() || status.Document().isNull());
    explanation.noSpace = StatusMgr::ShareIsNoSpace(share);
    explanation.needReindex = StatusMgr::ShareIsNeedReindex(share);
    explanation.hasRoom = !IsSharePresent(share) || FILEINDEX::IsShareSpaceEnough(share);
}

Explanation Look(const Place &place, const Folders &folders) {
    Explanation explanation{place, Judge(place)};
    explanation.covering = Covering(AsFullPath(place), folders);
    explanation.share = ShareOf(place.sharePath);
    if (!place.fullPath.empty()) {
        AddGoverning(folders, explanation);
    }
    if (!place.fullPath.empty() && !explanation.share.empty()) {
        AddQueued(folders, explanation);
    }
    if (!explanation.share.empty()) {
        AddFlags(explanation);
    }
    long long resumeTime = -1;
    if (StatusMgr::GetPauseInfo(resumeTime)) {
        explanation.resumeTime = resumeTime;
    }
    return explanation;
}

// The one thing to do next; empty when nothing stands in the way.
std::string RemedyFor(const Explanation &explanation) {
    if (const RuleOutcome *failed = explanation.verdict.Failed()) {
        return failed->remedy;
    }
    const std::string share = ShellWord(explanation.share);
    const Paths &covering = explanation.covering;
    const std::string governing = explanation.governing["path"].asString();
    const std::pair<bool, std::string> remedies[] = {
        {!explanation.verdict.indexable, "repeat the question; if the answer stays, see the system log"},
        {!explanation.passedOver.empty(),
         "keep files to be indexed elsewhere: the indexer does not go into " + Quoted(explanation.passedOver)},
        {covering.empty(), "\"fileindexctl add " + ShellWord(explanation.place.sharePath) + "\" has it indexed"},
        {!explanation.kindOff.empty(), explanation.kindOff + "; \"fileindexctl set " + ShellWord(governing) +
                                           " --media\" changes what is indexed"},
        {!explanation.hasRoom,
         "make room on the volume of the share (10 MiB), then \"fileindexctl revive " + share + "\""},
        {!explanation.areMarksKnown, "\"fileindexctl doctor\" tells what is wrong with the status file"},
        {explanation.noSpace, "\"fileindexctl revive " + share + "\", as there is room again"},
        {explanation.needReindex,
         "\"fileindexctl reindex " + ShellWord(covering.empty() ? "" : covering.front()) + "\""},
        {explanation.resumeTime && IsPaused(*explanation.resumeTime),
         "\"fileindexctl resume\", or wait for the end of the pause"},
        {true, ""},
    };
    return std::find_if(std::begin(remedies), std::end(remedies), [](const auto &row) { return row.first; })
        ->second;
}

std::string QueuedText(const Explanation &explanation) {
    if (!explanation.queueTrouble.empty()) {
        return explanation.queueTrouble;
    }
    if (!explanation.backlog) {
        return explanation.share.empty() ? "nothing: the path is in no share" : "the share is away";
    }
    const std::string also = explanation.reindexed.empty() ? "" : "; covered by the queued reindex of ";
    return BacklogText(*explanation.backlog) + also + Enumerate(explanation.reindexed);
}

std::string FlagsText(const Explanation &explanation) {
    if (explanation.share.empty()) {
        return "none";
    }
    std::vector<std::string> items;
    if (!explanation.hasRoom) {
        items.emplace_back(explanation.noSpace ? "out of space" : "out of space, though not marked so");
    } else if (explanation.noSpace) {
        items.emplace_back("marked as out of space, though there is room");
    }
    if (explanation.needReindex) {
        items.emplace_back("waiting for a reindex");
    }
    if (!explanation.areMarksKnown) {
        items.emplace_back("its marks cannot be told");
    }
    return explanation.share + (items.empty() ? "" : ": " + Enumerate(items));
}

void ShowFacts(const Explanation &explanation, Output &output) {
    const Place &place = explanation.place;
    const RuleOutcome *failed = explanation.verdict.Failed();
    const std::string reason = failed != nullptr ? ": " + failed->fact : "";
    const Json::Value &governing = explanation.governing;
    const std::string otherPath = place.isFull ? place.sharePath : place.fullPath;
    const std::string kind = explanation.kind.empty() ? "no file" : explanation.kind;
    output.Facts(
        {{"path", place.path + " (" + place.TakenAs() + ")"},
         {place.isFull ? "share path" : "full path", otherPath.empty() ? "none" : otherPath},
         {"indexable", explanation.verdict.indexable ? "yes" : "no" + reason},
         {"covered by", explanation.covering.empty() ? "no indexed folder" : Enumerate(explanation.covering)},
         {"governed by",
          governing.isNull() ? "no indexed folder" : governing["path"].asString() + ": " + MediaText(governing)},
         {"kind", explanation.kindOff.empty() ? kind : explanation.kindOff},
         {"passed over", explanation.passedOver.empty() ? "no" : "yes, at " + explanation.passedOver},
         {"queued", QueuedText(explanation)},
         {"share", FlagsText(explanation)},
         {"pause", explanation.resumeTime ? PauseText(*explanation.resumeTime) : "cannot be told"}});
}

// For programs; a table for people.
Json::Value ShowRules(const Verdict &verdict, Output &output) {
    static constexpr struct {
        const char *forPeople;
        const char *forPrograms;
        Colour colour;
    } kWordings[] = {{"passed", "passed", Colour::kGood},
                     {"FAILED", "failed", Colour::kBad},
                     {"not reached", "not_reached", Colour::kDim}};
    Rows rows = {{"RULE", "RESULT", "FACT"}};
    std::vector<Colour> colours = {Colour::kPlain};
    Json::Value data(Json::arrayValue);
    for (const auto &rule : verdict.rules) {
        const auto &wording = kWordings[static_cast<int>(rule.result)];
        rows.push_back({std::string(rule.label), wording.forPeople, rule.fact});
        colours.push_back(wording.colour);
        data.append(
            ToObject({{"rule", std::string(rule.key)}, {"result", wording.forPrograms}, {"fact", rule.fact}}));
    }
    const auto lines = Align(rows, 0);
    output.Line("");
    for (std::size_t i = 0; i < lines.size(); ++i) {
        output.Line(lines[i], colours[i]);
    }
    return data;
}

void FillData(const Explanation &explanation, Json::Value &data) {
    const RuleOutcome *failed = explanation.verdict.Failed();
    data["path"] = explanation.place.path;
    data["taken_as"] = explanation.place.TakenAs();
    data["share_path"] = OrNull(explanation.place.sharePath);
    data["full_path"] = OrNull(explanation.place.fullPath);
    data["indexable"] = explanation.verdict.indexable;
    data["explained"] = explanation.verdict.explained;
    data["failed_rule"] = failed != nullptr ? Json::Value(std::string(failed->key)) : Json::Value();
    data["covered_by"] = ToArray(explanation.covering);
    data["governed_by"] = explanation.governing;
    data["kind"] = OrNull(explanation.kind);
    data["kind_off"] = OrNull(explanation.kindOff);
    data["passed_over"] = OrNull(explanation.passedOver);
    data["queue"] = explanation.backlog ? BacklogJson(*explanation.backlog) : Json::Value();
    data["reindexed_with"] = ToArray(explanation.reindexed);
    data["resume_time"] = OrNull(explanation.resumeTime);
    auto &share = data["share"];
    if (!explanation.share.empty()) {
        const auto mark = [&](bool set) { return explanation.areMarksKnown ? Json::Value(set) : Json::Value(); };
        share = ToObject({{"name", explanation.share},
                          {"no_space", mark(explanation.noSpace)},
                          {"has_room", explanation.hasRoom},
                          {"need_reindex", mark(explanation.needReindex)}});
    }
}

}  // namespace

ExitStatus ExplainPath(const Arguments &arguments, Output &output) {
    const Folders folders = ReadFolders();
    const Explanation explanation = Look(PlaceToExplain(arguments.One("PATH"), folders), folders);
    const Verdict &verdict = explanation.verdict;
    const std::string remedy = RemedyFor(explanation);
    FillData(explanation, output.Data());
    output.Data()["remedy"] = OrNull(remedy);
    ShowFacts(explanation, output);
    output.Data()["rules"] = ShowRules(verdict, output);
    if (!verdict.explained) {
        output.Warn("the rules as they look now do not explain the library's answer, \"" +
                    std::string(verdict.indexable ? "yes" : "no") +
                    "\", which is the one that counts; something may be changing");
    }
    if (!remedy.empty()) {
        output.Line("");
        output.Line("remedy: " + remedy);
    }
    return verdict.indexable ? ExitStatus::kDone : ExitStatus::kNo;
}

}  // namespace VORK::FILEINDEXCTL
