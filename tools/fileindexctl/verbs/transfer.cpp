// "export" and "import": the whole configuration in one file.
#include "base/json/document.h"
#include "facts/configuration.h"
#include "facts/registrations.h"
#include "facts/whole_file.h"
#include "report/confirm.h"
#include "report/folder_text.h"
#include "report/schedule.h"
#include "verbs/folder_operations.h"

#include <fileindex/paths.h>
#include <fileindex/status.h>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr std::size_t kMostFolders = 1000;

// What importing would change, and how it is told.
struct ImportPlan {
    Json::Value upserts{Json::arrayValue};
    Paths removed{};
    bool removesFirst = false;  ///< both lists together may be more than can be stored
    bool leavesNone = false;    ///< the last folder goes before another comes
    Rows rows{};
    Json::Value data{};

    bool IsEmpty() const { return upserts.empty() && removed.empty() && data["status"].empty(); }
};

// The share of a folder that changes has to be there, and a new path has to be spelt as "add" wants it.
void RequireUsable(const std::string &path, bool isNew, const Folders &folders, const std::string &source) try {
    if (!isNew) {
        RequireShare(ShareOf(path));
    } else if (RequirePlain(path, folders).path != path) {
        throw Failure(ExitStatus::kUsage, "\"" + path + "\" is to be written without the \"/\" at its end");
    }
} catch (const Failure &failure) {
    throw Failure(failure.Status() == ExitStatus::kUsage ? ExitStatus::kMalformed : failure.Status(),
                  source + ": folder[" + Quoted(path) + "]: " + failure.what());
}

void PlanUpsert(const Json::Value &from, const Json::Value &to, ImportPlan &plan) {
    const std::string path = to["path"].asString();
    const std::string name = Quoted(to["name"].asString());
    const std::string media = MediaText(to);
    plan.upserts.append(to);
    if (from.isNull()) {
        plan.rows.push_back({"add", path, name + ": " + media});
        plan.data["added"].append(to);
        return;
    }
    std::string what;
    if (from["name"] != to["name"]) {
        what = Quoted(from["name"].asString()) + " -> " + name;
    }
    if (MediaText(from) != media) {
        what += (what.empty() ? "" : "; ") + MediaText(from) + " -> " + media;
    }
    plan.rows.push_back({"change", path, what});
    plan.data["changed"].append(ToObject({{"from", from}, {"to", to}}));
}

void PlanFolders(const FolderRecords &wanted, const std::string &source, bool replace, ImportPlan &plan) {
    const FolderRecords stored = StoredFolders();
    const Folders folders = ReadFolders();
    for (const auto &[path, record] : wanted) {
        const auto found = stored.find(path);
        const Json::Value from = found == stored.end() ? Json::Value() : found->second;
        if (from != record) {
            RequireUsable(path, from.isNull(), folders, source);
            PlanUpsert(from, record, plan);
        }
    }
    Paths kept;
    for (const auto &[path, record] : stored) {
        if (wanted.count(path) == 0) {
            (replace ? plan.removed : kept).push_back(path);
        }
    }
    const std::size_t added = plan.data["added"].size();
    const std::size_t total = stored.size() + added - plan.removed.size();
    if (added > 0 && total > kMostFolders) {
        throw Failure(ExitStatus::kCannotSave, source + ": there would be " + std::to_string(total) +
                                                   " folders, and no more than 1000 can be indexed");
    }
    FirstAway(plan.removed);
    for (const auto &path : plan.removed) {
        plan.rows.push_back({"remove", path});
    }
    for (const auto &path : kept) {
        plan.rows.push_back({"keep", path, "not in the file; --replace removes it"});
    }
    plan.data["removed"] = ToArray(plan.removed);
    plan.data["kept"] = ToArray(kept);
    plan.removesFirst = folders.size() + plan.upserts.size() > kMostFolders;
    plan.leavesNone = !plan.removed.empty() && plan.removed.size() == folders.size() &&
                      (plan.upserts.empty() || plan.removesFirst);
}

std::string NameOf(const Json::Value &flag) {
    const std::string name = flag["name"].asString();
    return name.empty() ? "\"\"" : name;
}

// `member` is one of status.conf, or "marker" for those with names of their own.
void PlanFlag(const std::string &member, const std::string &name, bool value, ImportPlan &plan) {
    const Json::Value flag = ToObject({{"member", member}, {"name", name}, {"to", value}});
    plan.rows.push_back({value ? "set" : "clear", member, NameOf(flag)});
    plan.data["status"].append(flag);
}

void PlanFlags(const std::string &member, const std::set<std::string> &stored, const std::set<std::string> &wanted,
               ImportPlan &plan) {
    for (const auto &name : wanted) {
        if (stored.count(name) == 0) {
            PlanFlag(member, name, true, plan);
        }
    }
    for (const auto &name : stored) {
        if (wanted.count(name) == 0 && member != "marker") {  // the library can set those, not take them back
            PlanFlag(member, name, false, plan);
        }
    }
}

void PlanStatus(const StatusSettings &wanted, const std::string &source, ImportPlan &plan) {
    const StatusSettings stored = StoredStatus();
    if (stored.resumeTime != wanted.resumeTime) {
        if (wanted.resumeTime > kLatestEnd) {
            throw Failure(ExitStatus::kMalformed, source + ": status[\"resume_time\"]: a pause cannot end after " +
                                                      std::to_string(kLatestEnd));
        }
        plan.rows.push_back({"set", "resume_time", PauseText(wanted.resumeTime)});
        plan.data["status"].append(ToObject({{"member", "resume_time"},
                                             {"from", ToNumber(stored.resumeTime)},
                                             {"to", ToNumber(wanted.resumeTime)}}));
    }
    PlanFlags("no_space", stored.noSpace, wanted.noSpace, plan);
    PlanFlags("need_reindex", stored.needReindex, wanted.needReindex, plan);
    PlanFlags("marker", stored.markers, wanted.markers, plan);
}

ImportPlan PlanImport(const Arguments &arguments) {
    const std::string file = arguments.One("FILE");
    const std::string source = file == "-" ? "standard input" : file;
    const Configuration wanted = ParseConfiguration(ReadWhole(file), source);
    ImportPlan plan;
    for (const char *list : {"added", "changed", "removed", "kept", "status"}) {
        plan.data[list] = Json::Value(Json::arrayValue);
    }
    if (wanted.folders) {
        PlanFolders(*wanted.folders, source, arguments.Has("--replace"), plan);
    }
    if (wanted.status) {
        PlanStatus(*wanted.status, source, plan);
    }
    plan.data["dry_run"] = arguments.Has("--dry-run");
    return plan;
}

void ShowPlan(const ImportPlan &plan, Output &output) {
    output.Data() = plan.data;
    for (const auto &path : PathsOf(plan.data["added"])) {
        std::string fullPath;
        FILEINDEX::GetFullPath(fullPath, path);
        WarnOfObstacle(path, fullPath, output);
    }
    output.Facts(plan.rows);
}

StepReport Apply(const Json::Value &change, const std::string &step, Patience &patience) {
    const std::string member = change["member"].asString();
    const std::string name = change["name"].asString();
    if (member == "resume_time") {
        return SetPause(change["to"].asInt64(), step, patience);
    }
    const bool value = change["to"].asBool();
    std::vector<PlannedStep> plan = {SaveStep(step)};
    std::function<bool()> call = [&] { return StatusMgr::SetUpdated(name); };
    if (member == "need_reindex") {
        call = [&] { return StatusMgr::ShareSetNeedReindex(name, value); };
    } else if (member == "no_space" && value) {
        plan.push_back(
            {"administrators told", "the administrators could not be notified", {}, {{records::kNotifyNoSpace}}});
        call = [&] { return StatusMgr::ShareSetNoSpace(name, true); };
    } else if (member == "no_space") {
        plan.push_back({"daemon told", "fileindexd cannot be reached", {{records::kReviveSend}}});
        call = [&] { return StatusMgr::ShareRevive(name); };
    }
    return StepReport::Perform(plan, FILEINDEX::Status(), patience, call);
}

// Folders first: the first of them starts the daemon, which then can be told of the rest. They are added before
// others are removed, so that the daemon is not stopped on the way from one list to another.
StepReport Apply(ImportPlan &plan, Patience &patience) {
    StepReport report;
    bool stopped = false;
    // What fails keeps the rest from being reached.
    const auto part = [&](const std::string &name, const std::function<StepReport()> &perform) {
        if (stopped) {
            report.Add(name, StepResult::kNotReached);
            return;
        }
        try {
            report.Append(perform());
        } catch (const Failure &failure) {
            if (!report.Has(StepResult::kDone)) {
                throw;
            }
            report.Add(name, StepResult::kFailed, failure.what());
        }
        stopped = report.Has(StepResult::kFailed);
    };
    const auto upsert = [&] {
        if (!plan.upserts.empty()) {
            part("saved", [&] { return PerformUpsert(plan.upserts, patience); });
        }
    };
    const auto remove = [&] {
        if (!plan.removed.empty()) {
            part("removal saved", [&] { return PerformRemoval("removal saved", plan.removed, patience); });
        }
    };
    plan.removesFirst ? remove() : upsert();
    plan.removesFirst ? upsert() : remove();
    for (const auto &change : plan.data["status"]) {
        const std::string member = change["member"].asString();
        const std::string step = member == "resume_time" ? "pause saved" : member + " " + NameOf(change);
        part(step, [&] { return Apply(change, step, patience); });
    }
    return report;
}

void AskForRemoval(const Arguments &arguments, const ImportPlan &plan) {
    if (plan.removed.empty()) {
        return;
    }
    Folders folders = ReadFolders();
    if (!plan.removesFirst) {
        for (const auto &path : PathsOf(plan.upserts)) {
            folders.emplace_back().path = path;
        }
    }
    RequireConsent(arguments, ConsequenceOf(plan.removed, folders));
}

void StateConfiguration(Output &output) {
    StateTotal(ReadFolders().size(), output);
    long long resumeTime = -1;
    if (StatusMgr::GetPauseInfo(resumeTime)) {
        output.Line(PauseText(resumeTime));
    } else {
        output.Warn("whether indexing is paused cannot be told; \"fileindexctl doctor\" says why");
    }
}

}  // namespace

ExitStatus ExportConfiguration(const Arguments &arguments, Output &output) {
    const FolderRecords folders = StoredFolders();
    const Json::Value document = DocumentOf(folders, StoredStatus());
    if (!arguments.Has("--output")) {
        output.Data() = document;
        output.Raw(FormatDocument(document));
        return ExitStatus::kDone;
    }
    const std::string file = arguments.One("--output");
    WriteWhole(file, FormatDocument(document));
    output.Data() = ToObject({{"file", file}, {"total", ToNumber(folders.size())}});
    output.Note("written to " + file);
    return ExitStatus::kDone;
}

ExitStatus ImportConfiguration(const Arguments &arguments, Output &output) {
    Patience patience(arguments);
    ImportPlan plan = PlanImport(arguments);
    ShowPlan(plan, output);
    if (plan.IsEmpty()) {
        output.Note("nothing is to be changed");
        return ExitStatus::kDone;
    }
    output.Flush();
    const std::string restart = RestartWith(!plan.upserts.empty(), plan.leavesNone);
    if (arguments.Has("--dry-run")) {
        AnnounceRestart(restart, output);
        output.Note("nothing was done");
        return ExitStatus::kDone;
    }
    AskForRemoval(arguments, plan);
    WarnOfResumption(SharesOf(PathsOf(plan.upserts)), SharesOf(ReadFolders()), output);
    AnnounceRestart(restart, output);
    const StepReport report = Apply(plan, patience);
    report.Show(output);
    StateConfiguration(output);
    return output.Conclude(report.Status(),
                           "not everything is done, or not everybody knows; once the cause is mended, "
                           "repeat the command, then \"fileindexctl migrate\" tells everybody again");
}

}  // namespace VORK::FILEINDEXCTL
