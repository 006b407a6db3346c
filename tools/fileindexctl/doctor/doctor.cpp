// "doctor": what is wrong, why it matters, what to do about it.
#include "../confirm.h"
#include "../failure.h"
#include "../handlers.h"
#include "../platform_file.h"
#include "../status_file.h"
#include "../text.h"
#include "finding.h"
#include "repairs.h"

namespace fileindexctl {

namespace doctor {

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
    return facts;
}

namespace {

constexpr Check kChecks[] = {
    {"configuration", CheckConfiguration},
    {"locks", CheckLocks},
    {"daemon", CheckDaemon},
    {"services", CheckServices},
    {"search", CheckSearch},
    {"shares", CheckShares},
    {"queues", CheckQueues},
    {"flags", CheckFlags},
};

struct Report {
    std::vector<std::pair<const char *, Findings>> checks{};

    std::size_t Count() const {
        std::size_t count = 0;
        for (const auto &[name, findings] : checks) {
            count += findings.size();
        }
        return count;
    }

    Repairs AllRepairs() const {
        Repairs repairs;
        for (const auto &[name, findings] : checks) {
            for (const auto &finding : findings) {
                if (finding.repair) {
                    repairs.push_back(*finding.repair);
                }
            }
        }
        return repairs;
    }
};

Report Examine() {
    const Facts facts = Look();
    Report report;
    for (const auto &check : kChecks) {
        report.checks.emplace_back(check.name, check.run(facts));
    }
    return report;
}

std::string CountText(std::size_t count) {
    return count == 0 ? "nothing found" : count == 1 ? "1 finding" : std::to_string(count) + " findings";
}

void ShowSummary(const Report &report, Output &output) {
    std::vector<std::vector<std::string>> rows;
    for (const auto &[name, findings] : report.checks) {
        rows.push_back({name, CountText(findings.size())});
    }
    const auto lines = Align(rows, 0);
    for (std::size_t i = 0; i < lines.size(); ++i) {
        output.Line(output.Paint(report.checks[i].second.empty() ? Colour::Good : Colour::Bad, lines[i]));
    }
}

void ShowFindings(const Report &report, Output &output) {
    for (const auto &[name, findings] : report.checks) {
        for (const auto &finding : findings) {
            output.Line("");
            output.Line(Printable(std::string(name) + ": " + finding.what));
            output.Line(Printable("  why:    " + finding.why));
            output.Line(Printable("  remedy: " + finding.remedy));
        }
    }
}

Json::Value FindingsJson(const Report &report) {
    Json::Value list(Json::arrayValue);
    for (const auto &[name, findings] : report.checks) {
        for (const auto &finding : findings) {
            Json::Value entry(Json::objectValue);
            entry["check"] = name;
            entry["what"] = finding.what;
            entry["why"] = finding.why;
            entry["remedy"] = finding.remedy;
            entry["fixable"] = finding.repair.has_value();
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
        output.Note(before.Count() == 0 ? "there is nothing to mend" : "nothing of this can be mended from here");
        return before;
    }
    output.Line("");
    ShowDifference(repairs, output);
    output.Flush();
    RequireConsent(arguments, "this makes the changes above, and keeps copies of files beside them");
    CarryOut(repairs, patience, output);
    Report after = Examine();
    output.Data()["remaining"] = FindingsJson(after);
    output.Line("");
    output.Line("left: " + CountText(after.Count()));
    ShowFindings(after, output);
    return after;
}

}  // namespace

}  // namespace doctor

ExitStatus ExamineSystem(const Arguments &arguments, Output &output) {
    const Patience patience(arguments);
    doctor::Report report = doctor::Examine();
    output.Data()["findings"] = doctor::FindingsJson(report);
    doctor::ShowSummary(report, output);
    doctor::ShowFindings(report, output);
    if (arguments.Has("--fix")) {
        report = doctor::Fix(report, arguments, patience, output);
    }
    return report.Count() == 0 ? ExitStatus::Done : ExitStatus::No;
}

}  // namespace fileindexctl
