// Do the configuration files parse, and can they be changed?
#include "../failure.h"
#include "../platform_file.h"
#include "../status_file.h"
#include "../text.h"
#include "finding.h"
#include "ownership.h"

#include <fileindex/folders.h>

#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <fstream>

namespace fileindexctl::doctor {

namespace {

std::string DirectoryOf(const std::string &path) {
    return path.substr(0, path.rfind('/'));
}

Findings CheckDirectory(const std::string &directory) {
    struct stat status {};
    if (stat(directory.c_str(), &status) == 0 && S_ISDIR(status.st_mode)) {
        return {};
    }
    const auto make = [directory] {
        if (mkdir(directory.c_str(), 0755) != 0) {
            throw Failure(ExitStatus::CannotSave, directory + " cannot be made: " + std::strerror(errno));
        }
    };
    return {{"there is no directory " + directory, "nothing can be saved: the library does not make it",
             "mkdir -p " + directory, Repair{directory, {"+ a directory, mode 0755"}, false, make}}};
}

std::string KindOf(const std::string &path) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0 || S_ISREG(status.st_mode)) {
        return {};
    }
    return S_ISLNK(status.st_mode) ? "a link" : S_ISDIR(status.st_mode) ? "a directory" : "a special file";
}

// What holds for every configuration file of the library.
Findings CheckFile(VORK::FILEINDEX::Config &config, const Repair &repair) {
    const std::string path = config.GetPath();
    const std::string kind = KindOf(path);
    if (!kind.empty()) {
        return {{path + " is " + kind + ", not a file",
                 "the library takes it for missing, and everything in it for not configured",
                 "put the file itself into that place"}};
    }
    Findings findings = CheckOwnership(path, "the file is to be read by everybody and changed by root alone");
    ForgetErrors();
    if (!config.Load()) {
        Finding finding{FailureOf(config).what(), "every operation on it fails", "mend it with an editor"};
        if (FailureOf(config).Status() != ExitStatus::Permission && repair.edit) {
            finding.repair = repair;
        }
        findings.push_back(finding);
    }
    return findings;
}

Repair EmptyStatus(const std::string &path) {
    std::ifstream file(path);
    Repair repair{path, {}, true, {}, [](Json::Value &document) { document = Json::objectValue; }, true};
    for (std::string line; std::getline(file, line);) {
        repair.difference.push_back("- " + line);
    }
    repair.difference.emplace_back("+ {}");
    return repair;
}

std::string OneLine(const Json::Value &value) {
    std::string text = value.toStyledString();
    text.erase(text.find_last_not_of('\n') + 1);
    return text;
}

bool IsPauseReadable(const Json::Value &document) {
    StatusFile file;
    file.Document() = document;
    long long resumeTime = 0;
    return file.GetPauseInfo(resumeTime);
}

// The library leaves null behind when it takes a mark back that was not there.
bool IsFlag(const Json::Value &member) {
    return member.isObject() || member.isNull();
}

struct MemberRule {
    const char *name;
    bool (*holds)(const Json::Value &document);
    const char *expected;
    const char *why;
};

constexpr MemberRule kMembers[] = {
    {"resume_time", IsPauseReadable, "a number",
     "whether indexing is paused cannot be told, and reports of the state fail"},
    {"no_space", [](const Json::Value &document) { return IsFlag(document["no_space"]); }, "an object",
     "no share can be marked as out of space, nor revived"},
    {"need_reindex", [](const Json::Value &document) { return IsFlag(document["need_reindex"]); }, "an object",
     "no share can be marked to be reindexed"},
};

Findings CheckMembers(const std::string &path, const Json::Value &document) {
    if (!document.isObject()) {
        return {{path + " is not a JSON object", "nothing in it can be told or changed", "mend it with an editor",
                 EmptyStatus(path)}};
    }
    Findings findings;
    for (const auto &rule : kMembers) {
        if (!rule.holds(document)) {
            const auto remove = [rule](Json::Value &changed) {
                if (!rule.holds(changed)) {
                    changed.removeMember(rule.name);
                }
            };
            findings.push_back(
                {path + ": " + Quoted(rule.name) + " is not " + rule.expected, rule.why, "remove the member",
                 Repair{
                     path, {"- " + Quoted(rule.name) + ": " + OneLine(document[rule.name])}, true, {}, remove}});
        }
    }
    return findings;
}

Findings CheckPlatform() {
    try {
        ReadPlatformFile();
        return {};
    } catch (const Failure &failure) {
        const bool isDenied = failure.Status() == ExitStatus::Permission;
        return {{failure.what(), "without it the platform knows no shares, and nothing can be indexed",
                 isDenied ? "run this as the administrator" : "mend it with an editor, or write a new one"}};
    }
}

void Append(Findings &findings, const Findings &more) {
    findings.insert(findings.end(), more.begin(), more.end());
}

}  // namespace

Findings CheckConfiguration(const Facts & /*facts*/) {
    VORK::FILEINDEX::Folders folders;
    StatusFile status;
    Findings findings = CheckDirectory(DirectoryOf(folders.GetPath()));
    Append(findings, CheckFile(folders, {}));
    Append(findings, CheckFile(status, EmptyStatus(status.GetPath())));
    Append(findings, CheckMembers(status.GetPath(), status.Document()));
    Append(findings, CheckPlatform());
    return findings;
}

}  // namespace fileindexctl::doctor
