// Registrations kept for the notification daemon.
#include "support.h"

#include <vorknotifyd/monitor_queue.h>

#include <fcntl.h>
#include <sys/file.h>

using platform_test::Fork;
using platform_test::Parse;
using platform_test::ReadText;
using platform_test::WaitFor;
using platform_test::WriteFile;
using VORKNOTIFYD::MONITOR_QUEUE_TYPE_FILE;
using VORKNOTIFYD::MONITOR_QUEUE_TYPE_NONE;
using VORKNOTIFYD::MonitorQueue;

namespace {

const std::string kDirectory = "/usr/vork/etc/vorknotifyd";
const std::string kFile = kDirectory + "/registrations.json";

Json::Value Description(const std::string &queue, const std::string &path) {
    Json::Value watch;
    watch["path"] = path;
    watch["mask"] = 65486U;
    watch["ignore"].append("@eaDir");
    Json::Value description;
    description["queue"] = queue;
    description["config"].append(watch);
    return description;
}

bool Upsert(const Json::Value &description, const std::string &name = "fileindex") {
    const MonitorQueue queue(description);
    return MonitorQueue::Upsert(queue, name, MONITOR_QUEUE_TYPE_FILE);
}

bool Delete(const std::string &queue, const std::string &name = "fileindex") {
    return MonitorQueue::Delete(queue, name, MONITOR_QUEUE_TYPE_FILE);
}

// "queue name watched-path..." of each registration, in the order of the file.
std::vector<std::string> Registered() {
    std::vector<std::string> registered;
    const Json::Value document = Parse(ReadText(kFile));
    for (const Json::Value &entry : document["registrations"]) {
        std::string line = entry["queue"].asString() + " " + entry["name"].asString();
        for (const Json::Value &watch : entry["config"]) {
            line += " " + watch["path"].asString();
        }
        registered.push_back(line);
    }
    return registered;
}

class MonitorQueueTest : public testing::Test {
protected:
    void SetUp() override { std::filesystem::remove_all(kDirectory); }
};

using Lines = std::vector<std::string>;

TEST_F(MonitorQueueTest, KeepsOneRegistrationForEachQueueAndName) {
    EXPECT_TRUE(Delete("/q1")) << "nothing was ever registered";
    EXPECT_FALSE(std::filesystem::exists(kDirectory));
    EXPECT_TRUE(Upsert(Description("/q2", "/vol1/b")));
    EXPECT_TRUE(Upsert(Description("/q1", "/vol1/a")));
    EXPECT_TRUE(Upsert(Description("/q1", "/vol1/a"), "other"));
    EXPECT_EQ(Registered(), (Lines{"/q1 fileindex /vol1/a", "/q1 other /vol1/a", "/q2 fileindex /vol1/b"}));
    EXPECT_TRUE(Upsert(Description("/q1", "/vol1/new")));
    EXPECT_EQ(Registered(), (Lines{"/q1 fileindex /vol1/new", "/q1 other /vol1/a", "/q2 fileindex /vol1/b"}));
    EXPECT_TRUE(Delete("/q1"));
    EXPECT_TRUE(Delete("/q1")) << "withdrawn already";
    EXPECT_EQ(Registered(), (Lines{"/q1 other /vol1/a", "/q2 fileindex /vol1/b"}));
}

TEST_F(MonitorQueueTest, StoresTheDescriptionAsItIs) {
    Json::Value description = Description("/vol1/caf\xE9/@eaDir/queue", "/vol1/caf\xE9 \"x\"");
    ASSERT_TRUE(Upsert(description));
    description["name"] = "fileindex";
    description["type"] = 1;
    Json::Value expected;
    expected["registrations"].append(description);
    // Compared as texts: the parser does not tell signed numbers from unsigned ones as the description does.
    EXPECT_EQ(Parse(ReadText(kFile)).toStyledString(), expected.toStyledString());
}

TEST_F(MonitorQueueTest, WritesTheDocumentedExample) {
    const Json::Value example = Parse(platform_test::DocumentedExample("\"registrations\""));
    Json::Value description = example["registrations"][0];
    description.removeMember("name");
    description.removeMember("type");
    ASSERT_TRUE(Upsert(description));
    EXPECT_EQ(Parse(ReadText(kFile)), example);
}

TEST_F(MonitorQueueTest, DoesNotWakeTheDaemonWithoutNeed) {
    ASSERT_TRUE(Upsert(Description("/q", "/vol1/a")));
    std::filesystem::create_hard_link(kFile, "/usr/vork/etc/before");
    ASSERT_TRUE(Upsert(Description("/q", "/vol1/a")));
    ASSERT_TRUE(Delete("/unheard"));
    EXPECT_TRUE(std::filesystem::equivalent(kFile, "/usr/vork/etc/before")) << "written again";
    std::filesystem::remove("/usr/vork/etc/before");
}

TEST_F(MonitorQueueTest, RefusesMalformedDescriptions) {
    ASSERT_TRUE(Upsert(Description("/q", "/vol1/a")));
    const std::string before = ReadText(kFile);
    const char *const rows[] = {
        "null",
        "[]",
        "{}",
        R"({"queue": "/q"})",
        R"({"config": []})",
        R"({"queue": "q", "config": []})",
        R"({"queue": "", "config": []})",
        R"({"queue": "/q\u0000", "config": []})",
        R"({"queue": 1, "config": []})",
        R"({"queue": "/q", "config": {}})",
        R"({"queue": "/q", "config": [1]})",
        R"({"queue": "/q", "config": [{"mask": 1, "ignore": []}]})",
        R"({"queue": "/q", "config": [{"path": "a", "mask": 1, "ignore": []}]})",
        R"({"queue": "/q", "config": [{"path": "/a", "mask": -1, "ignore": []}]})",
        R"({"queue": "/q", "config": [{"path": "/a", "mask": 4294967296, "ignore": []}]})",
        R"({"queue": "/q", "config": [{"path": "/a", "mask": "1", "ignore": []}]})",
        R"({"queue": "/q", "config": [{"path": "/a", "mask": 1, "ignore": "x"}]})",
        R"({"queue": "/q", "config": [{"path": "/a", "mask": 1, "ignore": [1]}]})",
        R"({"queue": "/q", "config": [{"path": "/a", "mask": 1}]})",
    };
    for (const char *row : rows) {
        VLIBCErrSetEx(0, "", 0);
        EXPECT_FALSE(Upsert(Parse(row))) << row;
        EXPECT_EQ(VLIBCErrGet(), VORK_ERR_BAD_PARAMETER) << row;
    }
    EXPECT_FALSE(Upsert(Description("/q", "/vol1/b"), ""));
    EXPECT_FALSE(MonitorQueue::Upsert(MonitorQueue(Description("/q", "/b")), "x", MONITOR_QUEUE_TYPE_NONE));
    EXPECT_FALSE(MonitorQueue::Delete("/q", "fileindex", MONITOR_QUEUE_TYPE_NONE));
    EXPECT_EQ(ReadText(kFile), before);
    EXPECT_TRUE(Upsert(Parse(R"({"queue": "/q", "config": []})"))) << "no folder is no mistake";
}

TEST_F(MonitorQueueTest, LeavesABrokenFileAlone) {
    for (const char *text : {"", "{broken", "[]", "{}", R"({"registrations": {}})", R"({"registrations": [1]})"}) {
        WriteFile(kFile, text);
        EXPECT_FALSE(Upsert(Description("/q", "/vol1/a"))) << text;
        EXPECT_EQ(VLIBCErrGet(), VORK_ERR_MALFORMED) << text;
        EXPECT_FALSE(Delete("/q")) << text;
        EXPECT_EQ(ReadText(kFile), text);
    }
}

TEST_F(MonitorQueueTest, IsNotStoppedByWhatACrashLeft) {
    ASSERT_TRUE(Upsert(Description("/q", "/vol1/a")));
    WriteFile(kFile + ".tmp", "{half");
    EXPECT_TRUE(Upsert(Description("/q", "/vol1/b")));
    EXPECT_EQ(Registered(), Lines{"/q fileindex /vol1/b"});
    EXPECT_FALSE(std::filesystem::exists(kFile + ".tmp"));
}

TEST_F(MonitorQueueTest, FailsWithTheFormerRegistrationInPlace) {
    ASSERT_TRUE(Upsert(Description("/q", "/vol1/a")));
    const int lock = open((kDirectory + "/registrations.lock").c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_EQ(flock(lock, LOCK_EX), 0);
    EXPECT_FALSE(Upsert(Description("/q", "/vol1/b")));
    EXPECT_EQ(VLIBCErrGet(), VORK_ERR_TIMEOUT);
    close(lock);

    platform_test::Mounts mounts;
    ASSERT_TRUE(mounts.Mount(kDirectory, kDirectory, "--bind"));
    ASSERT_EQ(platform_test::Shell("mount -n -o remount,bind,ro " + kDirectory), 0);
    EXPECT_FALSE(Upsert(Description("/q", "/vol1/b")));
    EXPECT_EQ(VLIBCErrGet(), VORK_ERR_ACCESS);
    EXPECT_EQ(Registered(), Lines{"/q fileindex /vol1/a"});
}

TEST_F(MonitorQueueTest, TakesRegistrationsFromManyProcesses) {
    constexpr int kProcesses = 8;
    constexpr int kRounds = 25;
    std::vector<pid_t> children;
    children.reserve(kProcesses);
    for (int process = 0; process < kProcesses; ++process) {
        children.push_back(Fork([process] {
            const std::string queue = "/q" + std::to_string(process);
            bool done = true;
            for (int round = 0; round < kRounds && done; ++round) {
                done = Upsert(Description(queue, "/vol1/" + std::to_string(round))) &&
                       Upsert(Description(queue, "/vol1/passing"), "passing") && Delete(queue, "passing");
            }
            return done ? 0 : 1;
        }));
    }
    for (const pid_t child : children) {
        EXPECT_EQ(WaitFor(child), 0);
    }
    Lines expected;
    for (int process = 0; process < kProcesses; ++process) {
        expected.push_back("/q" + std::to_string(process) + " fileindex /vol1/" + std::to_string(kRounds - 1));
    }
    EXPECT_EQ(Registered(), expected);
}

}  // namespace
