// The platform's files while many processes change and read them.
#include "support.h"

#include <vork/search.h>
#include <vorknotifyd/monitor_queue.h>

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

}  // namespace
