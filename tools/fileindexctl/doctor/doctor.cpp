// "doctor": what is wrong, why it matters, what to do about it.
#include "command_line/handlers.h"
#include "doctor/finding.h"
#include "report/confirm.h"
#include "report/text.h"

#include <unistd.h>

namespace VORK::FILEINDEXCTL {

namespace DOCTOR {

namespace {

struct Check {
    const char *name;
    void (*run)(Facts &facts, Findings &findings);
    bool needsFolders;  ///< it looks at nothing when the folders are not known
};

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

Findings Examine() {
    Facts facts;
    Findings findings;
    for (const auto &check : kChecks) {
        findings.Begin(check.name);
        if (check.needsFolders && !facts.areFoldersKnown) {
            findings.Add(kUnexamined, "the indexed folders are not known", {}, "it depends on them",
                         "mend what is found in the configuration");
        } else {
            check.run(facts, findings);
        }
    }
    return findings;
}

// Paths as they are, names in quotes, and not hundreds of them.
std::string WhatText(const Finding &finding) {
    std::vector<std::string> items;
    for (const auto &item : finding.items) {
        if (items.size() == kMostItems) {
            items.push_back(std::to_string(finding.items.size() - kMostItems) + " more");
            break;
        }
        items.push_back(item.starts_with('/') ? item : Quoted(item));
    }
    return finding.what + (items.empty() ? "" : ": " + Enumerate(items));
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
    return level == kWrong ? "wrong" : level == kNote ? "note" : "unexamined";
}

std::string CountText(const Findings &findings, std::string_view check = {}) {
    std::vector<std::string> counts;
    for (const Level level : {kWrong, kNote, kUnexamined}) {
        const std::size_t count = findings.Count(level, check);
        if (count > 0) {
            counts.push_back(std::to_string(count) + " " + NameOf(level) +
                             (level == kNote && count > 1 ? "s" : ""));
        }
    }
    return counts.empty() ? "ok" : Enumerate(counts);
}

void ShowSummary(const Findings &findings, Output &output) {
    std::vector<std::vector<std::string>> rows;
    for (const auto &check : kChecks) {
        rows.push_back({check.name, CountText(findings, check.name)});
    }
    const auto lines = Align(rows, 0);
    for (std::size_t i = 0; i < lines.size(); ++i) {
        output.Line(lines[i], findings.Count(kWrong, kChecks[i].name) > 0 ? Colour::kBad
                              : rows[i][1] == "ok"                        ? Colour::kGood
                                                                          : Colour::kPlain);
    }
}

// Lines for people, a member of that name for programs.
void ShowFindings(const Findings &findings, const char *member, Output &output) {
    Json::Value &list = output.Data()[member] = Json::arrayValue;
    for (const auto &finding : findings.All()) {
        Json::Value &entry = list.append(Json::objectValue);
        entry["check"] = finding.check;
        entry["level"] = NameOf(finding.level);
        entry["what"] = WhatText(finding);
        entry["items"] = ToArray(finding.items);
        entry["why"] = finding.why;
        entry["remedy"] = RemedyText(finding);
        entry["fixable"] = !finding.repairs.empty();
        output.Line("");
        output.Line(finding.check +
                    (finding.level == kWrong ? "" : std::string(" (") + NameOf(finding.level) + ")") + ": " +
                    WhatText(finding));
        output.Line("  why:    " + finding.why);
        output.Line("  remedy: " + RemedyText(finding));
        if (!finding.repairs.empty()) {
            entry["fix"] = finding.repairs.front().does;
            output.Line("  --fix:  " + finding.repairs.front().does);
        }
    }
}

Json::Value DifferenceJson(const Repairs &repairs) {
    Json::Value list(Json::arrayValue);
    for (const auto &repair : repairs) {
        Json::Value &entry = list.append(Json::objectValue);
        entry["target"] = repair.target;
        entry["difference"] = ToArray(repair.difference);
    }
    return list;
}

void ShowDifference(const Repairs &repairs, Output &output) {
    output.Line("");
    for (const auto &repair : repairs) {
        output.Line("to change: " + repair.target);
        for (const auto &line : repair.difference) {
            output.Line("  " + line, line.front() == '-' ? Colour::kBad : Colour::kGood);
        }
    }
    output.Flush();
}

// What is left afterwards.
Findings Fix(const Findings &before, const Arguments &arguments, Patience patience, Output &output) {
    const Repairs repairs = before.AllRepairs();
    output.Data()["fixes"] = DifferenceJson(repairs);
    if (repairs.empty()) {
        output.Note(before.Count(kWrong, {}) == 0 ? "there is nothing to mend"
                                                  : "nothing of this can be mended from here");
        return before;
    }
    if (geteuid() != 0) {  // some would succeed, and leave a lock file that is not root's
        throw Failure(ExitStatus::kPermission, "no permission to mend anything; run this as the administrator");
    }
    ShowDifference(repairs, output);
    RequireConsent(arguments, "this makes the changes above, and keeps copies of files beside them");
    CarryOut(repairs, patience, output);
    Findings after = Examine();
    output.Line("");
    output.Line("left: " + CountText(after));
    ShowFindings(after, "remaining", output);
    return after;
}

}  // namespace

}  // namespace DOCTOR

ExitStatus ExamineSystem(const Arguments &arguments, Output &output) {
    const Patience patience(arguments);
    DOCTOR::Findings findings = DOCTOR::Examine();
    DOCTOR::ShowSummary(findings, output);
    DOCTOR::ShowFindings(findings, "findings", output);
    if (arguments.Has("--fix")) {
        findings = DOCTOR::Fix(findings, arguments, patience, output);
    }
    return findings.Count(DOCTOR::kWrong, {}) == 0 ? ExitStatus::kDone : ExitStatus::kNo;
}

}  // namespace VORK::FILEINDEXCTL
