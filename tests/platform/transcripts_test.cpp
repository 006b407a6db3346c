// The platform's answers: each transcript is played again and compared with everything that comes of it.
//
//   # TEXT                          a remark
//   $ COMMAND                       run by the shell; lines after it that begin with a space belong to it. Below
//   stands
//                                   what it writes, each line after "| ", and its exit status unless that is 0:
//                                   "[1]"
//   ? COMMAND                       the transcript is skipped where this fails
//   QUESTION ABOUT = ANSWER         one call of the platform, see kQuestions, with the code that it leaves: "no
//   (quota)" QUESTION ABOUT | ABOUT = ANSWER the same answer about each
//
// Commands find the paths of platform.conf and of the registrations in $conf and $registrations.
// After a deliberate change, write the transcripts anew by running this program with REWRITE=1.
#include "machine.h"

#include <vork/error.h>
#include <vork/filesystem.h>
#include <vork/metadata.h>
#include <vork/process.h>
#include <vork/quota.h>
#include <vork/search.h>
#include <vork/service.h>
#include <vork/share.h>
#include <vorknotifyd/monitor_queue.h>

#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>

#include <map>
#include <sstream>
#include <vector>

namespace {

using namespace machine;      // NOLINT(google-build-using-namespace): the tools of every question
using namespace VORKNOTIFYD;  // NOLINT(google-build-using-namespace)
using Text = const std::string &;

constexpr char kOutput[] = "/tmp/output";

std::string Code() {
    static const std::map<int, std::string> names = {{0, ""},
                                                     {VORK_ERR_BAD_PARAMETER, " (bad parameter)"},
                                                     {VORK_ERR_EXEC, " (exec)"},
                                                     {VORK_ERR_NO_SPACE, " (no space)"},
                                                     {VORK_ERR_QUOTA, " (quota)"},
                                                     {VORK_ERR_NOT_FOUND, " (not found)"},
                                                     {VORK_ERR_EXISTS, " (exists)"},
                                                     {VORK_ERR_ACCESS, " (access)"},
                                                     {VORK_ERR_IO, " (I/O)"},
                                                     {VORK_ERR_TIMEOUT, " (timeout)"},
                                                     {VORK_ERR_MALFORMED, " (malformed)"},
                                                     {VORK_ERR_NO_SUCH_SHARE, " (no such share)"},
                                                     {VORK_ERR_SHARE_DIRECTORY_NAME, " (other name)"},
                                                     {VORK_ERR_NO_SUCH_SERVICE, " (no such service)"},
                                                     {VORK_ERR_SERVICE, " (service)"},
                                                     {VORK_ERR_REGISTRATIONS, " (registrations)"},
                                                     {VORK_ERR_UNIT_FAILED, " (unit failed)"},
                                                     {VORK_ERR_UNIT_MASKED, " (unit masked)"},
                                                     {VORK_ERR_UNIT_TIMEOUT, " (unit timeout)"}};
    return names.at(VLIBCErrGet());
}

std::string Answer(int result) {
    return result < 0 ? "failed" : result == 0 ? "no" : "yes";
}

std::string Done(int result) {
    return result == 0 ? "done" : "failed";
}

std::string PathOfShare(Text name) {
    VORKSHARE *share = nullptr;
    if (VORKShareGet(name.c_str(), &share) < 0) {
        return share == nullptr ? "failed" : "failed with a share";
    }
    std::string path = share->szName == name ? share->szPath : "another share";
    VORKShareFree(share);
    return path;
}

std::string Holder(Text path) {
    char name[492] = "";
    char directory[4096] = "";
    const int result = VORKShareNamePathGet(path.c_str(), name, sizeof name, directory, sizeof directory);
    return result < 0 ? "failed" : std::string(name) + " " + directory;
}

std::string Kind(Text path) {
    const int type = VORKGetFSType(path.c_str(), 0);
    return type < 0                      ? "failed"
           : VORKFSIsRemoteFS(type) != 0 ? "remote"
           : VORKFSIsImageFS(type) != 0  ? "image"
           : type == VORK_FS_TYPE_PSEUDO ? "pseudo"
                                         : "local";
}

/// The answer that a function hands out about a share or a path.
template <typename About>
std::string HandedOut(int (*question)(About, int *), About about) {
    int answer = -9;
    return question(about, &answer) < 0 ? "failed" : answer == -9 ? "nothing" : Answer(answer);
}

std::string Encryption(Text path) {
    const VORKSHARE share{"share", 0, path.c_str()};
    const std::string encrypted = HandedOut(VLIBShareIsEncryptionGet, &share);
    const std::string locked = HandedOut(VLIBShareIsEncryptedGet, &share);
    return encrypted == "failed" || locked == "failed" ? "failed"
           : encrypted == "no"                         ? "plain"
           : locked == "yes"                           ? "locked"
                                                       : "unlocked";
}

/// The mode is not the umask's to decide.
std::string MakeMetadata(Text path) {
    ::umask(077);
    const int result = VORKEAMKDir(0, path.c_str());
    ::umask(0);
    return Done(result);
}

std::string MakeMetadataAsUser(Text path) {
    constexpr uid_t kUser = 65534;
    Check(seteuid(kUser) == 0, "become a user");
    std::string answer = MakeMetadata(path);
    Check(seteuid(0) == 0, "become root");
    return answer;
}

std::string Register(Text name, Text description) {
    const MonitorQueue queue(Parse(description).value());
    return Done(MonitorQueue::Upsert(queue, name, MONITOR_QUEUE_TYPE_FILE) ? 0 : -1);
}

std::string Withdraw(Text name, Text queue) {
    return Done(MonitorQueue::Delete(queue, name, MONITOR_QUEUE_TYPE_FILE) ? 0 : -1);
}

/// What a program writes and the result, asked in a host that blocks and ignores signals and leaks a descriptor.
std::string Run(Text program, int discardOutput, int ignored) {
    std::istringstream words(program);
    const std::vector<std::string> arguments{std::istream_iterator<std::string>(words), {}};
    std::vector<const char *> argv;
    argv.reserve(arguments.size() + 1);
    for (const std::string &argument : arguments) {
        argv.push_back(argument.c_str());
    }
    argv.push_back(nullptr);
    Wait(Start([&] {
        sigset_t all;
        sigfillset(&all);
        sigprocmask(SIG_BLOCK, &all, nullptr);
        std::signal(SIGPIPE, SIG_IGN);
        std::signal(ignored, SIG_IGN);
        const int output = open(kOutput, O_WRONLY | O_CREAT | O_TRUNC | O_APPEND, 0600);
        dup2(output, STDOUT_FILENO);
        dup2(output, STDERR_FILENO);
        const int result = VLIBCExecv(argv[0], argv.data(), discardOutput, 0);
        dprintf(output, "%s", ((result < 0 ? "failed" : std::to_string(result)) + Code()).c_str());
    }));
    std::string shown = ReadFile(kOutput);
    std::replace(shown.begin(), shown.end(), '\n', ' ');
    return shown;
}

const std::map<std::string, std::string (*)(Text)> kQuestions = {
    {"share", PathOfShare},
    {"holder", Holder},
    {"recycled", [](Text path) { return Answer(VORKShareIsShareRecycle(path.c_str())); }},
    {"kind", Kind},
    {"mount-point", [](Text path) { return Answer(VORKFSDirIsMntPoint(path.c_str())); }},
    {"read-only",
     [](Text path) {
         const VORKSHARE share{"share", 0, path.c_str()};
         return HandedOut(VLIBShareIsReadOnlyGet, &share);
     }},
    {"encryption", Encryption},
    {"snapshot", [](Text path) { return HandedOut(VLIBFhsPathInSnapshot, path.c_str()); }},
    // "BYTES PATH"
    {"room",
     [](Text text) { return Answer(VORKQuotaIsEnough(0, text.c_str() + text.find(' ') + 1, std::stoull(text))); }},
    {"hidden", [](Text name) { return Answer(VORKEAIsHiddenDir(name.c_str())); }},
    {"make-metadata", MakeMetadata},
    {"make-metadata-as-user", MakeMetadataAsUser},
    {"remove", [](Text path) { return Done(VLIBCExec("/bin/rm", "-rf", path.c_str(), nullptr, nullptr)); }},
    {"search", [](Text) { return Answer(VORKSMBIsEnableSpotlight()); }},
    // In a file of this text.
    {"search-in", [](Text text) { return WriteFile(kPlatformConf, text), Answer(VORKSMBIsEnableSpotlight()); }},
    {"photo-in", [](Text text) { return WriteFile(kPlatformConf, text), PathOfShare("photo"); }},
    {"set-search", [](Text on) { return Done(VORKSMBSetSpotlight(on == "on" ? 1 : 0)); }},
    {"start", [](Text name) { return Done(VLIBServiceStart(name.c_str(), 1)); }},
    {"start-once", [](Text name) { return Done(VLIBServiceStart(name.c_str(), 0)); }},
    {"stop", [](Text name) { return Done(VLIBServiceStop(name.c_str(), 1)); }},
    {"restart", [](Text name) { return Done(VLIBServiceRestart(name.c_str())); }},
    {"register", [](Text description) { return Register("fileindex", description); }},
    {"register-in",
     [](Text text) { return WriteFile(kRegistrations, text), Register("x", R"({"queue": "/q", "config": []})"); }},
    {"register-other", [](Text description) { return Register("other", description); }},
    {"register-nameless", [](Text description) { return Register("", description); }},
    {"withdraw", [](Text queue) { return Withdraw("fileindex", queue); }},
    {"withdraw-other", [](Text queue) { return Withdraw("other", queue); }},
    {"run", [](Text program) { return Run(program, 0, SIGUSR1); }},
    {"run-quietly", [](Text program) { return Run(program, 1, SIGUSR1); }},
    {"run-without-children", [](Text program) { return Run(program, 0, SIGCHLD); }},
};

/// The line that asks and its answer; more than one line where the answers differ.
std::string Ask(const std::string &line) {
    constexpr std::string_view kNext = " | ";
    const size_t name = std::min(line.find(' '), line.size());
    const auto question = kQuestions.at(line.substr(0, name));
    std::string asked;
    std::string former;
    for (size_t at = std::min(name + 1, line.size()), end = 0; end < line.size(); at = end + kNext.size()) {
        end = std::min(line.find(kNext, at), line.size());
        VLIBCErrSetEx(0, "", 0);
        const std::string about = line.substr(at, end - at);
        const std::string result = question(about);
        const std::string answer = " = " + result + Code() + "\n";
        asked += answer == former ? std::string(kNext) : former + line.substr(0, name + 1);
        asked += about;
        former = answer;
    }
    return asked + former;
}

int Shell(const std::string &command) {
    const int status = std::system(command.c_str());
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

std::string Obey(const std::string &command) {
    const int status = Shell("(" + command + "\n) >" + kOutput + " 2>&1 </dev/null");
    std::istringstream output(ReadFile(kOutput));
    std::string shown = "$ " + command + "\n";
    for (std::string line; std::getline(output, line);) {
        shown += "| " + line + "\n";
    }
    return shown + (status == 0 ? "" : "[" + std::to_string(status) + "]\n");
}

struct Played {
    std::string text;
    int questions = 0;
    std::string lacking;  ///< the condition that this machine does not meet
};

Played Play(std::istream &&transcript) {
    Played played;
    for (std::string line; played.lacking.empty() && std::getline(transcript, line);) {
        for (std::string more; transcript.peek() == ' ' && std::getline(transcript, more);) {
            line += "\n" + more;
        }
        if (line.starts_with("$ ")) {
            played.text += Obey(line.substr(2));
        } else if (line.starts_with("#") || line.starts_with("?") || line.empty()) {
            played.text += line + "\n";
            const bool met = !line.starts_with("?") || Shell("(" + line.substr(1) + ") >/dev/null 2>&1") == 0;
            played.lacking = met ? "" : line;
        } else if (!line.starts_with("|") && !line.starts_with("[")) {
            played.text += Ask(line.substr(0, line.rfind(" = ")));
            ++played.questions;
        }
    }
    return played;
}

class TranscriptTest : public testing::TestWithParam<std::filesystem::path> {};

TEST_P(TranscriptTest, IsAnsweredAsItStands) {
    ::umask(0);  // or it would hide a mode that is too generous
    setenv("conf", kPlatformConf, 1);
    setenv("registrations", kRegistrations, 1);
    Check(Shell("! mountpoint -q /tmp/m || umount -n -l /tmp/m; mkdir -p /tmp/m && mount -n -t tmpfs m /tmp/m &&"
                " rm -rf $conf* ${registrations%/*} /vol1/* /vol2/*") == 0,
          "an empty machine");
    const Played played = Play(std::ifstream(GetParam()));
    if (!played.lacking.empty()) {
        GTEST_SKIP() << "fails here: " << played.lacking;
    }
    if (std::getenv("REWRITE") != nullptr) {
        WriteFile(GetParam(), played.text);
    }
    EXPECT_EQ(ReadFile(GetParam()), played.text);
    EXPECT_GT(played.questions, 0) << "an empty transcript";
}

std::vector<std::filesystem::path> Transcripts() {
    const char *source = std::getenv("SOURCE_DIR");
    const std::string directory = source == nullptr ? "." : source;
    return {std::filesystem::directory_iterator(directory + "/tests/platform/transcripts"), {}};
}

INSTANTIATE_TEST_SUITE_P(Platform, TranscriptTest, testing::ValuesIn(Transcripts()),
                         [](const auto &transcript) { return transcript.param.stem().string(); });

}  // namespace
