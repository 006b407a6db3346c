// The platform while others change what it works on, or end the thread or process that it works in.
#include "support.h"

#include <vork/filesystem.h>
#include <vork/process.h>
#include <vork/search.h>
#include <vork/share.h>
#include <vorknotifyd/monitor_queue.h>

#include <fcntl.h>
#include <pthread.h>
#include <signal.h>
#include <sys/stat.h>

#include <atomic>
#include <locale>
#include <thread>
#include <vector>

using platform_test::Fork;
using platform_test::kConfiguration;
using platform_test::Parse;
using platform_test::ReadText;
using platform_test::WaitFor;
using VORKNOTIFYD::MONITOR_QUEUE_TYPE_FILE;
using VORKNOTIFYD::MONITOR_QUEUE_TYPE_NONE;
using VORKNOTIFYD::MonitorQueue;

namespace {

// The address sanitizer's runtime does not survive the cancelling of threads, and in the child of a threaded
// process it may wait for ever for a lock of its own.
#ifdef __SANITIZE_ADDRESS__
constexpr bool kAddressSanitizer = true;
#else
constexpr bool kAddressSanitizer = false;
#endif

bool Register(const std::string &queue, int mask, const std::string &name) {
    Json::Value description;
    description["queue"] = queue;
    description["config"][0]["path"] = "/vol1";
    description["config"][0]["mask"] = mask;
    description["config"][0]["ignore"] = Json::Value(Json::arrayValue);
    return MonitorQueue::Upsert(MonitorQueue(description), name, MONITOR_QUEUE_TYPE_FILE);
}

TEST(ConcurrencyTest, LosesNoRegistrationOfManyProcesses) {
    constexpr int kProcesses = 8;
    constexpr int kRounds = 25;
    std::vector<pid_t> children;
    std::vector<std::string> expected;
    for (int process = 0; process < kProcesses; ++process) {
        const std::string queue = "/caf\xE9/" + std::to_string(process);  // names of files need not be UTF-8
        expected.push_back(queue + " fileindex " + std::to_string(kRounds));
        children.push_back(Fork([queue] {
            bool done = true;
            for (int round = 1; round <= kRounds && done; ++round) {
                done = Register(queue, round, "fileindex") && Register(queue, round, "passing") &&
                       MonitorQueue::Delete(queue, "passing", MONITOR_QUEUE_TYPE_FILE);
            }
            return done ? 0 : 1;
        }));
    }
    for (const pid_t child : children) {
        EXPECT_EQ(WaitFor(child), 0);
    }
    std::vector<std::string> registered;
    const Json::Value document = Parse(ReadText("/usr/vork/etc/vorknotifyd/registrations.json"));
    for (const Json::Value &entry : document["registrations"]) {
        registered.push_back(entry["queue"].asString() + " " + entry["name"].asString() + " " +
                             entry["config"][0]["mask"].asString());
    }
    EXPECT_EQ(registered, expected);
}

TEST(ConcurrencyTest, KnowsOneTypeOfRegistration) {
    Json::Value description;
    description["queue"] = "/q";
    description["config"] = Json::Value(Json::arrayValue);
    EXPECT_FALSE(MonitorQueue::Upsert(MonitorQueue(description), "x", MONITOR_QUEUE_TYPE_NONE));
    EXPECT_FALSE(MonitorQueue::Delete("/q", "fileindex", MONITOR_QUEUE_TYPE_NONE));
}

// A child that the host forks has a copy of every descriptor, and of the lock that one may stand for.
TEST(ConcurrencyTest, LeavesNoLockWithTheChildrenOfItsHost) {
    constexpr int kChildren = 30;
    std::vector<pid_t> children;
    children.reserve(kChildren);
    std::atomic<bool> done = false;
    std::thread registering([&done] {
        for (int mask = 1; !done; ++mask) {
            Register("/q", mask, "fileindex");
        }
    });
    for (int i = 0; i < kChildren; ++i) {
        children.push_back(Fork([] { return pause(); }));
    }
    done = true;
    registering.join();
    EXPECT_TRUE(Register("/q", 0, "fileindex")) << VLIBCErrGet();
    for (const pid_t child : children) {
        kill(child, SIGKILL);
        WaitFor(child);
    }
}

// Readers never see a file half written or missing.
TEST(ConcurrencyTest, ChangesTheSearchSettingInOneStep) {
    platform_test::WriteFile(kConfiguration, R"({"shares": {"photo": {"path": "/vol1/photo"}}})");
    const pid_t writer = Fork([] {
        int failed = 0;
        for (int i = 0; i < 300; ++i) {
            failed += VORKSMBSetSpotlight(i % 2);
        }
        return failed;
    });
    int status = 0;
    while (waitpid(writer, &status, WNOHANG) == 0) {
        const std::string text = ReadText(kConfiguration);
        ASSERT_TRUE(Parse(text)["shares"].isMember("photo")) << text;
    }
    EXPECT_EQ(status, 0);
}

/// A lookup that has to read the file, which is large: whatever happens to the thread happens in the middle of it.
int LookUp() {
    utimensat(AT_FDCWD, kConfiguration.c_str(), nullptr, 0);
    VORKSHARE *share = nullptr;
    const int result = VORKShareGet("share", &share);
    VORKShareFree(share);
    return result;
}

void ConfigureManyShares() {
    std::string shares = R"({"shares": {"share": {"path": "/vol1/share"})";
    for (int i = 0; i < 1000; ++i) {
        shares.append(", \"").append(std::to_string(i)).append("\": {}");
    }
    platform_test::WriteFile(kConfiguration, shares + "}}");
}

TEST(ConcurrencyTest, AnswersInTheChildOfAThreadedProcess) {
    if (kAddressSanitizer) {
        GTEST_SKIP() << "the sanitizer itself fails";
    }
    std::locale::global(std::locale("C.UTF-8"));  // with which the C++ library has a mutex to take
    constexpr int kChildren = 100;
    constexpr int kThreads = 3;
    ConfigureManyShares();
    std::atomic<bool> done = false;
    std::vector<std::thread> threads;
    threads.reserve(kThreads);
    for (int i = 0; i < kThreads; ++i) {
        threads.emplace_back([&done, i] {
            while (!done) {
                i == 0 ? LookUp() : VORKGetFSType("/vol1", 0);
            }
        });
    }
    int failed = 0;
    for (int i = 0; i < kChildren && failed == 0; ++i) {
        failed += WaitFor(Fork([] {
            alarm(60);
            return VORKGetFSType("/vol1", 0) < 0 ? 1 : LookUp();
        }));
    }
    done = true;
    for (std::thread &thread : threads) {
        thread.join();
    }
    EXPECT_EQ(failed, 0) << "a child hung";
}

TEST(ConcurrencyTest, OutlivesTheCancellingOfThreads) {
    if (kAddressSanitizer) {
        GTEST_SKIP() << "the sanitizer itself fails";
    }
    ConfigureManyShares();
    for (int i = 0; i < 25; ++i) {
        pthread_t thread{};
        const auto loop = [](void *) -> void * {
            for (;;) {
                LookUp();
            }
        };
        ASSERT_EQ(pthread_create(&thread, nullptr, loop, nullptr), 0);
        ASSERT_EQ(LookUp(), 0);
        pthread_cancel(thread);
        pthread_join(thread, nullptr);
    }
    EXPECT_EQ(LookUp(), 0);
}

TEST(ConcurrencyTest, CollectsTheProgramOfACancelledThread) {
    if (kAddressSanitizer) {
        GTEST_SKIP() << "the sanitizer itself fails";
    }
    ASSERT_EQ(mkfifo("/tmp/go", 0600), 0);
    pthread_t thread{};
    const auto run = [](void *) -> void * {
        VLIBCExec("/bin/sh", "-c", "read line </tmp/go", nullptr, nullptr);
        return nullptr;
    };
    ASSERT_EQ(pthread_create(&thread, nullptr, run, nullptr), 0);
    const int go = open("/tmp/go", O_WRONLY);
    pthread_cancel(thread);
    close(go);
    pthread_join(thread, nullptr);
    EXPECT_EQ(waitpid(-1, nullptr, WNOHANG), -1) << "a child is left";
}

TEST(ConcurrencyTest, RemovesNothingOfAStrangerWhileDirectoriesAreExchanged) {
    constexpr const char *kOurs = "/vol1/photo/@eaDir";
    constexpr const char *kLink = "/vol1/photo/link";
    constexpr const char *kStrangers = "/vol1/stranger/@eaDir/queue";
    platform_test::WriteFile(kConfiguration, R"({"shares": {"photo": {"path": "/vol1/photo"}}})");
    platform_test::WriteFile("/vol1/photo/@eaDir/queue", "");
    platform_test::WriteFile(kStrangers, "");
    ASSERT_EQ(symlink("/vol1/stranger/@eaDir", kLink), 0);
    const pid_t attacker = Fork([] {
        while (renameat2(AT_FDCWD, kOurs, AT_FDCWD, kLink, RENAME_EXCHANGE) == 0) {
        }
        return 1;
    });
    bool removed = false;
    for (int i = 0; i < 300 || (!removed && i < 10000); ++i) {
        removed |= VLIBCExec("/bin/rm", "-rf", "/vol1/photo/@eaDir/queue", nullptr, nullptr) == 0;
        ASSERT_EQ(access(kStrangers, F_OK), 0) << "removed in round " << i;
    }
    EXPECT_TRUE(removed);
    EXPECT_EQ(waitpid(attacker, nullptr, WNOHANG), 0) << "gave up";
    kill(attacker, SIGKILL);
    WaitFor(attacker);
}

}  // namespace
