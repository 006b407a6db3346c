// Child processes, and the error of each thread.
#include "support.h"

#include <vork/process.h>

#include <fcntl.h>

#include <csignal>
#include <thread>

using platform_test::Fork;
using platform_test::ReadText;
using platform_test::WaitFor;
using platform_test::WriteFile;

namespace {

int Sh(const char *script) {
    return VLIBCExec("/bin/sh", "-c", script, nullptr, nullptr);
}

int Exec(const char *program) {
    return VLIBCExec(program, nullptr, nullptr, nullptr, nullptr);
}

TEST(ProcessesTest, GiveTheirExitStatus) {
    EXPECT_EQ(Sh("exit 0"), 0);
    EXPECT_EQ(Sh("exit 3"), 3);
    EXPECT_EQ(Sh("exit 255"), 255);
    EXPECT_EQ(VLIBCExec("/bin/sh", "-c", "test \"$1\" = 'two words' -a $# = 1", "sh", "two words"), 0);
}

TEST(ProcessesTest, TellFailureFromAnExitStatus) {
    const char *const none[] = {nullptr};
    const char *const argv[] = {"true", nullptr};
    WriteFile("/tmp/not-executable", "text");
    const struct {
        const char *name;
        int code;
        std::function<int()> run;
    } rows[] = {
        {"killed", VORK_ERR_EXEC, [] { return Sh("kill -9 $$"); }},
        {"missing", VORK_ERR_EXEC, [] { return Exec("/bin/no-such-program"); }},
        {"not executable", VORK_ERR_EXEC, [] { return Exec("/tmp/not-executable"); }},
        {"relative", VORK_ERR_BAD_PARAMETER, [] { return Exec("true"); }},
        {"null", VORK_ERR_BAD_PARAMETER, [] { return Exec(nullptr); }},
        {"no vector", VORK_ERR_BAD_PARAMETER, [] { return VLIBCExecv("/bin/true", nullptr, 0, 0); }},
        {"empty vector", VORK_ERR_BAD_PARAMETER, [&] { return VLIBCExecv("/bin/true", none, 0, 0); }},
        {"reserved argument", VORK_ERR_BAD_PARAMETER, [&] { return VLIBCExecv("/bin/true", argv, 0, 1); }},
    };
    for (const auto &row : rows) {
        VLIBCErrSetEx(0, "", 0);
        EXPECT_LT(row.run(), 0) << row.name;
        EXPECT_EQ(VLIBCErrGet(), row.code) << row.name;
    }
}

TEST(ProcessesTest, StartCleanWhateverTheHostDoes) {
    const int leaking = open("/dev/null", O_RDONLY);
    ASSERT_GE(leaking, 3);
    sigset_t blocked;
    sigfillset(&blocked);
    sigset_t former;
    sigprocmask(SIG_BLOCK, &blocked, &former);
    const auto formerPipe = std::signal(SIGPIPE, SIG_IGN);
    const auto formerUsr1 = std::signal(SIGUSR1, SIG_IGN);
    EXPECT_EQ(Sh("exec >/tmp/child; ls /proc/self/fd | wc -l; readlink /proc/self/fd/0"), 0);
    // Not by way of the shell, which clears the mask itself. Two signals of the C library's own, 32 and 33, are
    // its business.
    EXPECT_EQ(VLIBCExec("/bin/sed", "-nE", R"(s/^Sig(Blk|Ign):\t0*(18000000)?/\1 /w /tmp/signals)",
                        "/proc/self/status", nullptr),
              0);
    std::signal(SIGPIPE, formerPipe);
    std::signal(SIGUSR1, formerUsr1);
    sigprocmask(SIG_SETMASK, &former, nullptr);
    close(leaking);
    // The fourth descriptor is that of "ls" on the directory.
    EXPECT_EQ(ReadText("/tmp/child"), "4\n/dev/null\n");
    EXPECT_EQ(ReadText("/tmp/signals"), "Blk \nIgn 0\n");
}

TEST(ProcessesTest, SucceedInAHostThatIgnoresItsChildren) {
    std::signal(SIGCHLD, SIG_IGN);
    EXPECT_EQ(Sh("echo ran >/tmp/ignored"), 0);
    std::signal(SIGCHLD, SIG_DFL);
    EXPECT_EQ(ReadText("/tmp/ignored"), "ran\n") << "returned before the end";
}

TEST(ProcessesTest, KeepOutputOrDiscardIt) {
    for (const int discard : {0, 1}) {
        const pid_t child = Fork([discard] {
            dup2(open("/tmp/output", O_WRONLY | O_CREAT | O_TRUNC, 0600), 1);
            dup2(1, 2);
            const char *const argv[] = {"sh", "-c", "echo out; echo err >&2", nullptr};
            return VLIBCExecv("/bin/sh", argv, discard, 0);
        });
        EXPECT_EQ(WaitFor(child), 0);
        EXPECT_EQ(ReadText("/tmp/output"), discard == 1 ? "" : "out\nerr\n");
    }
}

TEST(ErrorsTest, BelongToTheThread) {
    VLIBCErrSetEx(0x2900, "here.cpp", 7);
    std::thread([] {
        EXPECT_EQ(VLIBCErrGet(), 0);
        EXPECT_STREQ(VLIBCErrorGetFile(), "");
        EXPECT_EQ(VLIBCErrorGetLine(), 0);
        VLIBCErrSetEx(1, nullptr, 2);
        EXPECT_STREQ(VLIBCErrorGetFile(), "");
    }).join();
    EXPECT_EQ(VLIBCErrGet(), 0x2900);
    EXPECT_STREQ(VLIBCErrorGetFile(), "here.cpp");
    EXPECT_EQ(VLIBCErrorGetLine(), 7);
    Exec(nullptr);
    EXPECT_STREQ(VLIBCErrorGetFile(), "processes.cpp") << "without its directory";
}

}  // namespace
