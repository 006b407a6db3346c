// The platform's answers: each transcript is played again and compared with everything that comes of it.
//
//   # TEXT               a remark
//   $ COMMAND            run by the shell; lines behind it that begin with a space belong to it. Below stands what
//                        it writes, each line behind "| ", and its exit status unless that is 0: "[1]"
//   ? COMMAND            the transcript is left out where this fails
//   QUESTION = ANSWER    one call of the platform, see kQuestions, with the code that it leaves: "failed (exec)"
//
// After a deliberate change, write the transcripts anew by running this program with REWRITE=1.
#include "support.h"

#include <vork/filesystem.h>
#include <vork/metadata.h>
#include <vork/process.h>
#include <vork/quota.h>
#include <vork/search.h>
#include <vork/service.h>
#include <vork/share.h>
#include <vorknotifyd/monitor_queue.h>

#include <sys/stat.h>
#include <unistd.h>

#include <map>
#include <optional>
#include <vector>

namespace {

namespace fs = std::filesystem;
using platform_test::Shell;
using VORKNOTIFYD::MONITOR_QUEUE_TYPE_FILE;
using VORKNOTIFYD::MonitorQueue;

std::string Code() {
    static const std::map<int, std::string> names = {{VORK_ERR_BAD_PARAMETER, "bad parameter"},
                                                     {VORK_ERR_NO_SPACE, "no space"},
                                                     {VORK_ERR_QUOTA, "quota"},
                                                     {VORK_ERR_NOT_FOUND, "not found"},
                                                     {VORK_ERR_EXISTS, "exists"},
                                                     {VORK_ERR_ACCESS, "access"},
                                                     {VORK_ERR_IO, "I/O"},
                                                     {VORK_ERR_TIMEOUT, "timeout"},
                                                     {VORK_ERR_MALFORMED, "malformed"},
                                                     {VORK_ERR_NO_SUCH_SHARE, "no such share"},
                                                     {VORK_ERR_SHARE_DIRECTORY_NAME, "other name"},
                                                     {VORK_ERR_NO_SUCH_SERVICE, "no such service"},
                                                     {VORK_ERR_SERVICE, "service"},
                                                     {VORK_ERR_REGISTRATIONS, "registrations"},
                                                     {VORK_ERR_UNIT_FAILED, "unit failed"},
                                                     {VORK_ERR_UNIT_MASKED, "unit masked"},
                                                     {VORK_ERR_UNIT_TIMEOUT, "unit timeout"}};
    return VLIBCErrGet() == 0 ? "" : " (" + names.at(VLIBCErrGet()) + ")";
}

std::string Answer(int result) {
    return result < 0 ? "failed" : result == 0 ? "no" : "yes";
}

std::string Done(int result) {
    return result == 0 ? "done" : "failed";
}

std::string PathOfShare(const std::string &name) {
    VORKSHARE *share = nullptr;
    if (VORKShareGet(name.c_str(), &share) < 0) {
        return share == nullptr ? "failed" : "failed with a share";
    }
    std::string path = share->szName == name ? share->szPath : "another share";
    VORKShareFree(share);
    return path;
}

std::string Holder(const std::string &path) {
    char name[492] = "";
    char directory[4096] = "";
    const int result = VORKShareNamePathGet(path.c_str(), name, sizeof name, directory, sizeof directory);
    return result < 0 ? "failed" : std::string(name) + " " + directory;
}

std::string Kind(const std::string &path) {
    const int type = VORKGetFSType(path.c_str(), 0);
    return type < 0                      ? "failed"
           : VORKFSIsRemoteFS(type) != 0 ? "remote"
           : VORKFSIsImageFS(type) != 0  ? "image"
           : type == VORK_FS_TYPE_PSEUDO ? "pseudo"
                                         : "local";
}

std::string IsReadOnly(const std::string &path) {
    const VORKSHARE share{"share", 0, path.c_str()};
    int readOnly = -9;
    return VLIBShareIsReadOnlyGet(&share, &readOnly) < 0 ? "failed" : Answer(readOnly);
}

std::string IsInSnapshot(const std::string &path) {
    int inSnapshot = -9;
    return VLIBFhsPathInSnapshot(path.c_str(), &inSnapshot) < 0 ? "failed" : Answer(inSnapshot);
}

/// "BYTES PATH"
std::string HasRoom(const std::string &text) {
    const size_t space = text.find(' ');
    return Answer(VORKQuotaIsEnough(0, text.c_str() + space + 1, std::stoull(text)));
}

/// The mode is not the umask's to decide.
std::string MakeMetadata(const std::string &path) {
    ::umask(077);
    const int result = VORKEAMKDir(0, path.c_str());
    ::umask(0);
    return Done(result);
}

std::string MakeMetadataAsUser(const std::string &path) {
    constexpr uid_t kUser = 65534;
    if (seteuid(kUser) != 0) {
        return "not asked";
    }
    std::string answer = MakeMetadata(path);
    return seteuid(0) == 0 ? answer : "still a user";
}

/// "NAME DESCRIPTION"
std::string Register(const std::string &text) {
    const size_t space = text.find(' ');
    const MonitorQueue queue(platform_test::Parse(text.substr(space + 1)));
    return Answer(MonitorQueue::Upsert(queue, text.substr(0, space), MONITOR_QUEUE_TYPE_FILE) ? 1 : -1);
}

/// "NAME QUEUE"
std::string Withdraw(const std::string &text) {
    const size_t space = text.find(' ');
    return Answer(
        MonitorQueue::Delete(text.substr(space + 1), text.substr(0, space), MONITOR_QUEUE_TYPE_FILE) ? 1 : -1);
}

using Text = const std::string &;
const std::map<std::string, std::string (*)(Text)> kQuestions = {
    {"share", PathOfShare},
    {"holder", Holder},
    {"recycled", [](Text path) { return Answer(VORKShareIsShareRecycle(path.c_str())); }},
    {"kind", Kind},
    {"mount-point", [](Text path) { return Answer(VORKFSDirIsMntPoint(path.c_str())); }},
    {"read-only", IsReadOnly},
    {"encryption", platform_test::Encryption},
    {"snapshot", IsInSnapshot},
    {"room", HasRoom},
    {"hidden", [](Text name) { return Answer(VORKEAIsHiddenDir(name.c_str())); }},
    {"make-metadata", MakeMetadata},
    {"make-metadata-as-user", MakeMetadataAsUser},
    {"remove", [](Text path) { return Done(VLIBCExec("/bin/rm", "-rf", path.c_str(), nullptr, nullptr)); }},
    {"search", [](Text) { return Answer(VORKSMBIsEnableSpotlight()); }},
    {"set-search", [](Text on) { return Done(VORKSMBSetSpotlight(on == "on" ? 1 : 0)); }},
    {"start", [](Text name) { return Done(VLIBServiceStart(name.c_str(), 1)); }},
    {"start-once", [](Text name) { return Done(VLIBServiceStart(name.c_str(), 0)); }},
    {"stop", [](Text name) { return Done(VLIBServiceStop(name.c_str(), 1)); }},
    {"restart", [](Text name) { return Done(VLIBServiceRestart(name.c_str())); }},
    {"register", Register},
    {"withdraw", Withdraw},
};

std::string Ask(const std::string &question) {
    const size_t end = std::min(question.find(' '), question.size());
    VLIBCErrSetEx(0, "", 0);
    const std::string answer =
        kQuestions.at(question.substr(0, end))(question.substr(std::min(end + 1, question.size())));
    return question + " = " + answer + Code() + "\n";
}

std::string Run(const std::string &command) {
    const int status = Shell("(" + command + "\n) >/tmp/output 2>&1 </dev/null");
    std::ifstream output("/tmp/output");
    std::string shown = command + "\n";
    for (std::string line; std::getline(output, line);) {
        shown += "| " + line + "\n";
    }
    return shown + (status == 0 ? "" : "[" + std::to_string(status) + "]\n");
}

/// Nothing when the machine lacks something.
std::optional<std::string> Play(std::istream &&transcript) {
    std::string played;
    for (std::string line; std::getline(transcript, line);) {
        for (std::string more; transcript.peek() == ' ' && std::getline(transcript, more);) {
            line += "\n" + more;
        }
        if (line.starts_with("? ") && Shell(line.substr(2) + " >/dev/null 2>&1") != 0) {
            return std::nullopt;
        }
        if (line.starts_with("$ ")) {
            played += "$ " + Run(line.substr(2));
        } else if (line.starts_with("#") || line.starts_with("?") || line.empty()) {
            played += line + "\n";
        } else if (!line.starts_with("|") && !line.starts_with("[")) {
            played += Ask(line.substr(0, line.rfind(" = ")));
        }
    }
    return played;
}

class TranscriptTest : public testing::TestWithParam<fs::path> {};

TEST_P(TranscriptTest, IsAnsweredAsItStands) {
    ::umask(0);  // or it would hide a mode that is too generous
    ASSERT_EQ(
        Shell("! mountpoint -q /tmp/m || umount -n -l /tmp/m; mkdir -p /tmp/m && mount -n -t tmpfs m /tmp/m &&"
              " rm -rf /usr/vork/etc/platform.conf* /usr/vork/etc/vorknotifyd /vol1/* /vol2/*"),
        0);
    const auto played = Play(std::ifstream(GetParam()));
    if (!played) {
        GTEST_SKIP() << "this machine lacks something";
    }
    if (std::getenv("REWRITE") != nullptr) {
        platform_test::WriteFile(GetParam(), *played);
    }
    EXPECT_EQ(platform_test::ReadText(GetParam()), *played);
}

std::vector<fs::path> Transcripts() {
    const char *source = std::getenv("SOURCE_DIR");
    const fs::path directory = fs::path(source == nullptr ? "." : source) / "tests/platform/transcripts";
    return {fs::directory_iterator(directory), {}};
}

INSTANTIATE_TEST_SUITE_P(Platform, TranscriptTest, testing::ValuesIn(Transcripts()),
                         [](const auto &transcript) { return transcript.param.stem().string(); });

}  // namespace
