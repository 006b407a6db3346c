// Do the configuration files parse, and can they be changed, by root alone?
#include "base/path_cover.h"
#include "doctor/finding.h"
#include "facts/platform_file.h"
#include "facts/registrations.h"
#include "report/text.h"

#include <fileindex/folders.h>

#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <system_error>
#include <utility>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

namespace fs = std::filesystem;

constexpr mode_t kMode = 0644;
constexpr const char *kMendIt = "mend it with an editor";
constexpr const char *kOwnDirectory = "/usr/vork";

void CheckDirectory(const std::string &directory, Findings &findings) {
    std::error_code error;
    if (fs::is_directory(directory, error)) {
        return;
    }
    const auto make = [directory](Patience &, std::string &) {
        if (mkdir(directory.c_str(), 0755) != 0) {
            throw ErrnoFailure(directory, "made");
        }
    };
    findings.Add(kWrong, "there is no directory " + directory, {},
                 "nothing can be saved: the library does not make it", "mkdir -p " + directory,
                 {directory, "makes it, mode 0755", {"+ a directory, mode 0755"}, make});
}

// The files, and what leads to them: who may write to one of these directories can put another file into its
// place. Those of the system itself are not for this program to change.
void CheckWays(const std::vector<std::string> &paths, Findings &findings) {
    std::set<std::string> places;
    for (const auto &path : paths) {
        std::error_code error;
        for (auto place = fs::canonical(path, error); !error && places.insert(place).second;) {
            place = place.parent_path();
        }
    }
    for (const auto &place : places) {
        CheckOwnership(place, kNotForOthersToWrite,
                       "others than root can exchange the configuration, and so what root does with it",
                       IsAtOrUnder(place, kOwnDirectory) ? Correcting(place, kNotForOthersToWrite) : Action(),
                       findings);
    }
}

std::string KindOf(const std::string &path) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0 || S_ISREG(status.st_mode)) {
        return {};
    }
    return S_ISLNK(status.st_mode) ? "a link" : S_ISDIR(status.st_mode) ? "a directory" : "a special file";
}

// What holds for every configuration file of the library.
void CheckFile(VORK::FILEINDEX::Config &config, const Repair &repair, Findings &findings) {
    const std::string path = config.GetPath();
    const std::string kind = KindOf(path);
    if (!kind.empty()) {
        return findings.Add(kWrong, path + " is " + kind + ", not a file", {},
                            "the library takes it for missing, and everything in it for not configured",
                            "put the file itself into that place");
    }
    CheckOwnership(path, kMode, "the file is to be read by everybody and changed by root alone",
                   Correcting(path, kMode), findings);
    ForgetErrors();
    if (config.Load()) {
        return;
    }
    const Failure failure = FailureOf(config);
    if (failure.Status() == ExitStatus::kPermission) {
        findings.AddNotAllowed(failure.what());
    } else {
        findings.Add(kWrong, failure.what(), {}, "every operation on it fails", kMendIt, repair);
    }
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

// The library leaves null behind when it takes a mark back that was not there.
bool IsFlag(const Json::Value &member) {
    return member.isObject() || member.isNull();
}

bool IsPause(const Json::Value &member) {
    StatusFile file;
    file.Document()["resume_time"] = member;
    long long resumeTime = 0;
    return file.GetPauseInfo(resumeTime);
}

struct MemberRule {
    const char *name;
    bool (*holds)(const Json::Value &member);
    const char *expected;
    const char *why;
};

constexpr MemberRule kMembers[] = {
    {"resume_time", IsPause, "a number",
     "whether indexing is paused cannot be told, and reports of the state fail"},
    {"no_space", IsFlag, "an object", "no share can be marked as out of space, nor revived"},
    {"need_reindex", IsFlag, "an object", "no share can be marked to be reindexed"},
};

void CheckMembers(const std::string &path, const Json::Value &document, Findings &findings) {
    if (!document.isObject()) {
        return findings.Add(kWrong, path + " is not a JSON object", {}, "nothing in it can be told or changed",
                            kMendIt, EmptyStatus(path));
    }
    for (const auto &rule : kMembers) {
        if (rule.holds(document[rule.name])) {
            continue;
        }
        const auto remove = [rule](Json::Value &changed) {
            if (!rule.holds(std::as_const(changed)[rule.name])) {
                changed.removeMember(rule.name);
            }
        };
        findings.Add(kWrong, path + ": " + Quoted(rule.name) + " is not " + rule.expected, {}, rule.why,
                     "remove the member",
                     {path,
                      "removes the member",
                      {"- " + Quoted(rule.name) + ": " + OneLine(document[rule.name])},
                      {},
                      remove});
    }
}

void CheckPlatform(const Facts &facts, Findings &findings) {
    const std::string path = kPlatformFile;
    if (const auto &failure = facts.platformFailure) {
        if (failure->Status() == ExitStatus::kPermission) {
            return findings.AddNotAllowed(failure->what());
        }
        return findings.Add(kWrong, failure->what(), {},
                            "without it the platform knows no shares, and nothing can be indexed",
                            std::string(kMendIt) + ", or write a new one");
    }
    for (const auto &member : UnknownMembers(facts.platform)) {
        findings.Add(kNote, "unknown member in " + path, {member},
                     "it is ignored; if it is misspelt, a share or a setting is missing",
                     "correct its name if it is misspelt");
    }
    if (!facts.platform["shares"].isNull() && !facts.platform["shares"].isObject()) {
        findings.Add(kWrong, path + ": \"shares\" is not an object", {},
                     "the platform knows no shares, and nothing can be indexed", kMendIt);
    }
}

}  // namespace

void CheckConfiguration(Facts &facts, Findings &findings) {
    VORK::FILEINDEX::Folders folders;
    StatusFile status;
    const std::string directory = fs::path(folders.GetPath()).parent_path();
    CheckDirectory(directory, findings);
    CheckWays({directory, kPlatformFile, kRegistrationsFile}, findings);
    CheckFile(folders, {}, findings);
    CheckFile(status, EmptyStatus(status.GetPath()), findings);
    CheckMembers(status.GetPath(), status.Document(), findings);
    CheckPlatform(facts, findings);
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
