// The platform while others change what it works on, or end the thread or process that it works in.
#include "machine.h"

#include <vork/error.h>
#include <vork/filesystem.h>
#include <vork/process.h>
#include <vork/search.h>
#include <vork/share.h>
#include <vorknotifyd/monitor_queue.h>

#include <gtest/gtest.h>

#include <fcntl.h>
#include <pthread.h>
#include <sys/stat.h>

#include <locale>
#include <thread>
#include <vector>

using namespace machine;  // NOLINT(google-build-using-namespace): the tools of every test

namespace {

constexpr char kPhoto[] = R"({"shares": {"photo": {"path": "/vol1/photo"}}})";

/// A lookup that has to read the file, which is large: whatever happens to the thread happens in the middle of it.
bool LookUp() {
    utimensat(AT_FDCWD, kPlatformConf, nullptr, 0);
    VORKSHARE *share = nullptr;
    const int result = VORKShareGet("share", &share);
    VORKShareFree(share);
    return result == 0;
}

void ConfigureManyShares() {
    std::string shares = R"({"shares": {"share": {"path": "/vol1/share"})";
    for (int i = 0; i < 1000; ++i) {
        shares.append(", \"").append(std::to_string(i)).append("\": {}");
    }
    WriteFile(kPlatformConf, shares + "}}");
}

bool Register(const std::string &queue, int mask, const std::string &name = "fileindex") {
    using namespace VORKNOTIFYD;  // NOLINT(google-build-using-namespace)
    Json::Value description = *Parse(R"({"config": [{"path": "/vol1", "ignore": []}]})");
    description["queue"] = queue;
    description["config"][0]["mask"] = mask;
    return MonitorQueue::Upsert(MonitorQueue(description), name, MONITOR_QUEUE_TYPE_FILE) &&
           (name == "fileindex" || MonitorQueue::Delete(queue, name, MONITOR_QUEUE_TYPE_FILE));
}

// The address sanitizer's runtime does not survive the cancelling of threads, and in the child of a threaded
// process it may wait for ever for a lock of its own.
class ThreadsTest : public testing::Test {
protected:
    void SetUp() override {
#ifdef __SANITIZE_ADDRESS__
        GTEST_SKIP() << "the sanitizer itself fails";
#endif
        ConfigureManyShares();
    }
};

TEST(ConcurrencyTest, LosesNoRegistrationOfManyProcesses) {
    constexpr int kRounds = 25;
    std::vector<pid_t> children;
    std::vector<std::string> expected;
    for (int process = 0; process < 8; ++process) {
        const std::string queue = "/caf\xE9/" + std::to_string(process);  // names of files need not be UTF-8
        expected.push_back(queue + " fileindex " + std::to_string(kRounds));
        children.push_back(Start([queue] {
            for (int round = 1; round <= kRounds; ++round) {
                Check(Register(queue, round) && Register(queue, round, "passing"), "register");
            }
        }));
    }
    for (const pid_t child : children) {
        EXPECT_EQ(Wait(child), 0);
    }
    std::vector<std::string> registered;
    const Json::Value document = Parse(ReadFile(kRegistrations)).value();
    for (const Json::Value &entry : document["registrations"]) {
        registered.push_back(entry["queue"].asString() + " " + entry["name"].asString() + " " +
                             entry["config"][0]["mask"].asString());
    }
    EXPECT_EQ(registered, expected);
}

// A child that the host forks has a copy of every descriptor, and of the lock that one may stand for.
TEST(ConcurrencyTest, LeavesNoLockWithTheChildrenOfItsHost) {
    std::jthread registering([](const std::stop_token &end) {
        for (int mask = 1; !end.stop_requested(); ++mask) {
            Register("/q", mask);
        }
    });
    std::vector<pid_t> children;
    for (int i = 0; i < 30; ++i) {
        children.push_back(fork());
        if (children.back() == 0) {
            pause();
        }
    }
    registering.request_stop();
    registering.join();
    EXPECT_TRUE(Register("/q", 0)) << VLIBCErrGet();
    for (const pid_t child : children) {
        Kill(child);
    }
}

// Readers never see a file half written or missing.
TEST(ConcurrencyTest, ChangesTheSearchSettingInOneStep) {
    WriteFile(kPlatformConf, kPhoto);
    const pid_t writer = Start([] {
        for (int i = 0; i < 300; ++i) {
            Check(VORKSMBSetSpotlight(i % 2) == 0, "set");
        }
    });
    int status = 0;
    while (waitpid(writer, &status, WNOHANG) == 0) {
        const std::string text = ReadFile(kPlatformConf);
        ASSERT_TRUE(Parse(text).value_or(Json::Value())["shares"].isMember("photo")) << text;
    }
    EXPECT_EQ(status, 0);
}

TEST(ConcurrencyTest, RemovesNothingOfAStrangerWhileDirectoriesAreExchanged) {
    constexpr const char *kOurs = "/vol1/photo/@eaDir";
    constexpr const char *kLink = "/vol1/photo/link";
    constexpr const char *kStrangers = "/vol1/stranger/@eaDir/queue";
    WriteFile(kPlatformConf, kPhoto);
    WriteFile("/vol1/photo/@eaDir/queue", "");
    WriteFile(kStrangers, "");
    ASSERT_EQ(symlink("/vol1/stranger/@eaDir", kLink), 0);
    const pid_t attacker = Start([] {
        while (renameat2(AT_FDCWD, kOurs, AT_FDCWD, kLink, RENAME_EXCHANGE) == 0) {
        }
    });
    bool removed = false;
    for (int i = 0; i < 300 || (!removed && i < 10000); ++i) {
        removed |= VLIBCExec("/bin/rm", "-rf", "/vol1/photo/@eaDir/queue", nullptr, nullptr) == 0;
        ASSERT_EQ(access(kStrangers, F_OK), 0) << "removed in round " << i;
    }
    EXPECT_TRUE(removed);
    Kill(attacker);
}

TEST_F(ThreadsTest, LeaveTheirChildrenAbleToAsk) {
    std::locale::global(std::locale("C.UTF-8"));  // with which the C++ library has a mutex to take
    std::vector<std::jthread> threads;
    threads.reserve(3);
    for (int i = 0; i < 3; ++i) {
        threads.emplace_back([i](const std::stop_token &end) {
            while (!end.stop_requested()) {
                i == 0 ? LookUp() : VORKGetFSType("/vol1", 0) >= 0;
            }
        });
    }
    for (int i = 0; i < 100; ++i) {
        ASSERT_EQ(Wait(Start([] {
                      alarm(60);
                      Check(VORKGetFSType("/vol1", 0) >= 0 && LookUp(), "ask");
                  })),
                  0)
            << "a child hung";
    }
}

TEST_F(ThreadsTest, LeaveNothingWhenTheyAreCancelled) {
    for (int i = 0; i < 25; ++i) {
        pthread_t thread{};
        const auto loop = [](void *isRunning) -> void * {
            for (;;) {
                isRunning == nullptr ? LookUp() : VLIBCExec("/bin/sleep", "0.01", nullptr, nullptr, nullptr) == 0;
                pthread_testcancel();
            }
        };
        ASSERT_EQ(pthread_create(&thread, nullptr, loop, i % 2 == 0 ? nullptr : &thread), 0);
        ASSERT_TRUE(LookUp());
        pthread_cancel(thread);
        pthread_join(thread, nullptr);
        EXPECT_EQ(waitpid(-1, nullptr, WNOHANG), -1) << "a child is left";
    }
    EXPECT_TRUE(LookUp());
}

}  // namespace
