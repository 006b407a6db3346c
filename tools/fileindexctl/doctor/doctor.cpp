// "doctor": what is wrong, why it matters, what to do about it.
#include "command_line/handlers.h"
#include "doctor/finding.h"
#include "doctor/repairs.h"
#include "facts/platform_file.h"
#include "facts/status_file.h"
#include "report/confirm.h"
#include "report/failure.h"
#include "report/text.h"

#include <unistd.h>

#include <algorithm>
#include <numeric>

namespace VORK::FILEINDEXCTL {

namespace DOCTOR {

namespace {

bool AreAllKnown(const std::vector<std::string> &shares) {
    try {
        return !shares.empty() && UnknownMembers(ReadPlatformFile()).empty() &&
               std::all_of(shares.begin(), shares.end(), IsSharePresent);
    } catch (const Failure &) {
        return false;
    }
}

}  // namespace

Facts Look() {
    Facts facts;
    try {
        facts.folders = ReadFolders();
        facts.areFoldersKnown = true;
    } catch (const Failure &) {
        facts.areFoldersKnown = false;  // which the check of the configuration reports
    }
    for (const auto &folder : facts.folders) {
        ++facts.folderCount[ShareOf(folder.path)];
    }
    StatusFile file;
    if (file.Load()) {
        facts.status = file.Document();
    }
    facts.configuredShares = ConfiguredShares();
    facts.areSharesKnown = AreAllKnown(facts.configuredShares);
    return facts;
}

void Append(Findings &findings, const Findings &more) {
    findings.insert(findings.end(), more.begin(), more.end());
}

Finding NotAllowed(const std::string &what, const std::vector<std::string> &items) {
    return {what, "this user may not look at it", "run this as the administrator", {}, Level::kUnexamined, items};
}

namespace {

constexpr Check kChecks[] = {
    {"configuration", CheckConfiguration, false},
    {"locks", CheckLocks, false},
    {"daemon", CheckDaemon, true},
    {"services", CheckServices, true},
    {"search", CheckSearch, true},
    {"shares", CheckShares, false},
    {"queues", CheckQueues, true},
    {"monitor", CheckMonitor, true},
    {"flags", CheckFlags, false},
};

constexpr std::size_t kMostItems = 5;

struct Result {
    const char *check;
    Findings findings{};

    std::size_t Count(Level level) const {
        return static_cast<std::size_t>(std::count_if(
            findings.begin(), findings.end(), [level](const auto &finding) { return finding.level == level; }));
    }
};

struct Report {
    std::vector<Result> results{};

    std::size_t Count(Level level) const {
        return std::accumulate(
            results.begin(), results.end(), std::size_t{0},
            [level](std::size_t sum, const Result &result) { return sum + result.Count(level); });
    }

    Repairs AllRepairs() const {
        Repairs repairs;
        for (const auto &result : results) {
            for (const auto &finding : result.findings) {
                repairs.insert(repairs.end(), finding.repairs.begin(), finding.repairs.end());
            }
        }
        return repairs;
    }
};

bool IsOfOneKind(const Finding &one, const Finding &other) {
    return !one.items.empty() && !other.items.empty() && one.what == other.what && one.why == other.why &&
           one.remedy == other.remedy && one.level == other.level && one.repairs.empty() == other.repairs.empty();
}

Findings Grouped(const Findings &findings) {
    Findings groups;
    for (const auto &finding : findings) {
        const auto group = std::find_if(groups.begin(), groups.end(),
                                        [&](const Finding &other) { return IsOfOneKind(finding, other); });
        if (group == groups.end()) {
            groups.push_back(finding);
            continue;
        }
        group->items.insert(group->items.end(), finding.items.begin(), finding.items.end());
        group->repairs.insert(group->repairs.end(), finding.repairs.begin(), finding.repairs.end());
    }
    return groups;
}

// Paths as they are, names in quotes, and not hundreds of them.
std::string ItemsText(const Finding &finding) {
    std::vector<std::string> items;
    for (const auto &item : finding.items) {
        if (items.size() == kMostItems) {
            items.push_back(std::to_string(finding.items.size() - kMostItems) + " more");
            break;
        }
        items.push_back(item.starts_with('/') ? item : Quoted(item));
    }
    return Enumerate(items);
}

std::string WhatText(const Finding &finding) {
    return finding.what + (finding.items.empty() ? "" : ": " + ItemsText(finding));
}

std::string RemedyText(const Finding &finding) {
    std::string text = finding.remedy;
    if (finding.items.empty()) {
        return text;
    }
    const std::string word = ShellWord(finding.items.front());
    bool isNamed = false;
    for (auto place = text.find('%'); place != std::string::npos; place = text.find('%', place + word.size())) {
        text.replace(place, 1, word);
        isNamed = true;
    }
    return text + (isNamed && finding.items.size() > 1 ? "; the others likewise" : "");
}

const char *NameOf(Level level) {
    return level == Level::kWrong ? "wrong" : level == Level::kNote ? "note" : "unexamined";
}

Report Examine() {
    const Facts facts = Look();
    Report report;
    for (const auto &check : kChecks) {
        if (check.needsFolders && !facts.areFoldersKnown) {
            report.results.push_back({check.name,
                                      {{"the indexed folders are not known",
                                        "it depends on them",
                                        "mend what is found in the configuration",
                                        {},
                                        Level::kUnexamined}}});
        } else {
            report.results.push_back({check.name, Grouped(check.run(facts))});
        }
    }
    return report;
}

template <typename Counted>  // a Result or a Report
std::string CountText(const Counted &counted) {
    std::vector<std::string> counts;
    for (const Level level : {Level::kWrong, Level::kNote, Level::kUnexamined}) {
        const std::size_t count = counted.Count(level);
        if (count > 0) {
            counts.push_back(std::to_string(count) + " " + NameOf(level) +
                             (level == Level::kNote && count > 1 ? "s" : ""));
        }
    }
    return counts.empty() ? "ok" : Enumerate(counts);
}

void ShowSummary(const Report &report, Output &output) {
    std::vector<std::vector<std::string>> rows;
    for (const auto &result : report.results) {
        rows.push_back({result.check, CountText(result)});
    }
    const auto lines = Align(rows, 0);
    for (std::size_t i = 0; i < lines.size(); ++i) {
        const Result &result = report.results[i];
        output.Line(lines[i], result.Count(Level::kWrong) > 0 ? Colour::kBad
                              : result.findings.empty()       ? Colour::kGood
                                                              : Colour::kPlain);
    }
}

void ShowFindings(const Report &report, Output &output) {
    for (const auto &result : report.results) {
        for (const auto &finding : result.findings) {
            const std::string level =
                finding.level == Level::kWrong ? "" : std::string(" (") + NameOf(finding.level) + ")";
            output.Line("");
            output.Line(Printable(result.check + level + ": " + WhatText(finding)));
            output.Line(Printable("  why:    " + finding.why));
            output.Line(Printable("  remedy: " + RemedyText(finding)));
            if (!finding.repairs.empty()) {
                output.Line(Printable("  --fix:  " + finding.repairs.front().does));
            }
        }
    }
}

Json::Value FindingsJson(const Report &report) {
    Json::Value list(Json::arrayValue);
    for (const auto &result : report.results) {
        for (const auto &finding : result.findings) {
            Json::Value entry(Json::objectValue);
            entry["check"] = result.check;
            entry["level"] = NameOf(finding.level);
            entry["what"] = WhatText(finding);
            entry["items"] = ToArray(finding.items);
            entry["why"] = finding.why;
            entry["remedy"] = RemedyText(finding);
            entry["fixable"] = !finding.repairs.empty();
            if (!finding.repairs.empty()) {
                entry["fix"] = finding.repairs.front().does;
            }
            list.append(entry);
        }
    }
    return list;
}

Json::Value DifferenceJson(const Repairs &repairs) {
    Json::Value list(Json::arrayValue);
    for (const auto &repair : repairs) {
        Json::Value entry(Json::objectValue);
        entry["target"] = repair.target;
        entry["difference"] = ToArray(repair.difference);
        list.append(entry);
    }
    return list;
}

// What is left afterwards.
Report Fix(const Report &before, const Arguments &arguments, Patience patience, Output &output) {
    const Repairs repairs = before.AllRepairs();
    output.Data()["fixes"] = DifferenceJson(repairs);
    if (repairs.empty()) {
        output.Note(before.Count(Level::kWrong) == 0 ? "there is nothing to mend"
                                                     : "nothing of this can be mended from here");
        return before;
    }
    if (geteuid() != 0) {  // some would succeed, and leave a lock file that is not root's
        throw Failure(ExitStatus::kPermission, "no permission to mend anything; run this as the administrator");
    }
    output.Line("");
    ShowDifference(repairs, output);
    output.Flush();
    RequireConsent(arguments, "this makes the changes above, and keeps copies of files beside them");
    CarryOut(repairs, patience, output);
    Report after = Examine();
    output.Data()["remaining"] = FindingsJson(after);
    output.Line("");
    output.Line("left: " + CountText(after));
    ShowFindings(after, output);
    return after;
}

}  // namespace

}  // namespace DOCTOR

ExitStatus ExamineSystem(const Arguments &arguments, Output &output) {
    const Patience patience(arguments);
    DOCTOR::Report report = DOCTOR::Examine();
    output.Data()["findings"] = DOCTOR::FindingsJson(report);
    DOCTOR::ShowSummary(report, output);
    DOCTOR::ShowFindings(report, output);
    if (arguments.Has("--fix")) {
        report = DOCTOR::Fix(report, arguments, patience, output);
    }
    return report.Count(DOCTOR::Level::kWrong) == 0 ? ExitStatus::kDone : ExitStatus::kNo;
}

}  // namespace VORK::FILEINDEXCTL
