// Do the configuration files parse, and can they be changed, by root alone?
#include "base/path_cover.h"
#include "doctor/finding.h"
#include "doctor/ownership.h"
#include "facts/platform_file.h"
#include "facts/registrations.h"
#include "facts/status_file.h"
#include "report/failure.h"
#include "report/text.h"

#include <fileindex/folders.h>

#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <system_error>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

constexpr const char *kOwnDirectory = "/usr/vork";

std::string DirectoryOf(const std::string &path) {
    return path.substr(0, path.rfind('/'));
}

Findings CheckDirectory(const std::string &directory) {
    struct stat status {};
    if (stat(directory.c_str(), &status) == 0 && S_ISDIR(status.st_mode)) {
        return {};
    }
    const auto make = [directory](Patience &) {
        if (mkdir(directory.c_str(), 0755) != 0) {
            throw ErrnoFailure(directory, "made");
        }
        return std::string();
    };
    return {{"there is no directory " + directory,
             "nothing can be saved: the library does not make it",
             "mkdir -p " + directory,
             {{directory, "makes it, mode 0755", {"+ a directory, mode 0755"}, make}}}};
}

// The file, and what leads to it: who may write to one of these directories can put another file into its place.
// Those of the system itself are not for this program to change.
Findings CheckWay(const std::string &path) {
    Findings findings;
    std::error_code error;
    for (auto place = std::filesystem::canonical(path, error); !error; place = place.parent_path()) {
        Findings found =
            CheckOwnership(place, kNotForOthersToWrite,
                           "others than root can exchange the configuration, and so what root does with it");
        for (auto &finding : found) {
            if (!IsAtOrUnder(place.native(), kOwnDirectory)) {
                finding.repairs.clear();
            }
        }
        Append(findings, found);
        if (place == place.parent_path()) {
            break;
        }
    }
    return findings;
}

// The ways of all files, which share most of theirs.
Findings CheckWays(const std::string &directory) {
    std::map<std::vector<std::string>, Finding> findings;
    for (const std::string &path : {directory, std::string(kPlatformFile), std::string(kRegistrationsFile)}) {
        for (const auto &finding : CheckWay(path)) {
            findings.emplace(finding.items, finding);
        }
    }
    Findings list;
    for (const auto &[items, finding] : findings) {
        list.push_back(finding);
    }
    return list;
}

std::string KindOf(const std::string &path) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0 || S_ISREG(status.st_mode)) {
        return {};
    }
    return S_ISLNK(status.st_mode) ? "a link" : S_ISDIR(status.st_mode) ? "a directory" : "a special file";
}

// What holds for every configuration file of the library.
Findings CheckFile(VORK::FILEINDEX::Config &config, const Repairs &repairs) {
    const std::string path = config.GetPath();
    const std::string kind = KindOf(path);
    if (!kind.empty()) {
        return {{path + " is " + kind + ", not a file",
                 "the library takes it for missing, and everything in it for not configured",
                 "put the file itself into that place"}};
    }
    Findings findings =
        CheckOwnership(path, kReadByAll, "the file is to be read by everybody and changed by root alone");
    ForgetErrors();
    if (config.Load()) {
        return findings;
    }
    const Failure failure = FailureOf(config);
    findings.push_back(
        failure.Status() == ExitStatus::kPermission
            ? NotAllowed(failure.what())
            : Finding{failure.what(), "every operation on it fails", "mend it with an editor", repairs});
    return findings;
}

Repair EmptyStatus(const std::string &path) {
    std::ifstream file(path);
    Repair repair{path,
                  "puts an empty document into its place",
                  {},
                  {},
                  [](Json::Value &document) { document = Json::objectValue; },
                  true};
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
        return {{path + " is not a JSON object",
                 "nothing in it can be told or changed",
                 "mend it with an editor",
                 {EmptyStatus(path)}}};
    }
    Findings findings;
    for (const auto &rule : kMembers) {
        if (!rule.holds(document)) {
            const auto remove = [rule](Json::Value &changed) {
                if (!rule.holds(changed)) {
                    changed.removeMember(rule.name);
                }
            };
            findings.push_back({path + ": " + Quoted(rule.name) + " is not " + rule.expected,
                                rule.why,
                                "remove the member",
                                {{path,
                                  "removes the member",
                                  {"- " + Quoted(rule.name) + ": " + OneLine(document[rule.name])},
                                  {},
                                  remove}}});
        }
    }
    return findings;
}

Findings CheckPlatform() {
    try {
        const Json::Value document = ReadPlatformFile();
        Findings findings;
        for (const auto &member : UnknownMembers(document)) {
            findings.push_back({std::string("unknown member in ") + kPlatformFile,
                                "it is ignored; if it is misspelt, a share or a setting is missing",
                                "correct its name if it is misspelt",
                                {},
                                Level::kNote,
                                {member}});
        }
        if (!document["shares"].isNull() && !document["shares"].isObject()) {
            findings.push_back({std::string(kPlatformFile) + ": \"shares\" is not an object",
                                "the platform knows no shares, and nothing can be indexed",
                                "mend it with an editor"});
        }
        return findings;
    } catch (const Failure &failure) {
        if (failure.Status() == ExitStatus::kPermission) {
            return {NotAllowed(failure.what())};
        }
        return {{failure.what(), "without it the platform knows no shares, and nothing can be indexed",
                 "mend it with an editor, or write a new one"}};
    }
}

}  // namespace

Findings CheckConfiguration(const Facts & /*facts*/) {
    VORK::FILEINDEX::Folders folders;
    StatusFile status;
    Findings findings = CheckDirectory(DirectoryOf(folders.GetPath()));
    Append(findings, CheckWays(DirectoryOf(folders.GetPath())));
    Append(findings, CheckFile(folders, {}));
    Append(findings, CheckFile(status, {EmptyStatus(status.GetPath())}));
    Append(findings, CheckMembers(status.GetPath(), status.Document()));
    Append(findings, CheckPlatform());
    return findings;
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
