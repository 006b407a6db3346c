// Commands to the daemon's socket.
#include "fixture.h"

#include <sys/socket.h>

#include <cerrno>
#include <csignal>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

namespace fileindex_test {
namespace {

std::string FrameOf(const std::string &text) {
    const auto length = static_cast<std::uint32_t>(text.size() + 1);
    std::string frame(sizeof length, '\0');
    std::memcpy(frame.data(), &length, sizeof length);
    return frame + text + '\0';
}

class DaemonSocket : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        daemon_.Start();
    }
    /// The text on the wire; a size of 3,060 bytes takes three chunks.
    static std::string TextWith(size_t size) {
        return R"({"data":")" + std::string(size, 'x') + R"(","type":"x"})";
    }
    static bool Send(size_t size = 9) { return SendCammandToDaemon("x", std::string(size, 'x')); }
};

TEST_F(DaemonSocket, CarriesOneFrameForEachCommandInChunksOf1024Bytes) {
    EXPECT_TRUE(SendCammandToDaemon("x\xff", Json::Value()));
    EXPECT_TRUE(Send(5000));
    EXPECT_THAT(daemon_.Frames(),
                ElementsAre(FrameOf("{\"data\":null,\"type\":\"x\xff\"}"), FrameOf(TextWith(5000))));
    EXPECT_EQ(2, Calls("connect", "110")) << "the size of the whole address";
    EXPECT_EQ(2, Calls("write", "] 4")) << "the lengths";
    EXPECT_EQ(4, Calls("write", "] 1024"));
    EXPECT_EQ(1, Calls("write", "] " + std::to_string(TextWith(5000).size() + 1 - size_t{4} * 1024)));
}

TEST_F(DaemonSocket, FailsWhenAStepDoes) {
    const std::string timeout = std::to_string(SO_SNDTIMEO) + " 1";  // in seconds
    const std::string frame = FrameOf(TextWith(3000));
    const std::string head = frame.substr(0, 4);
    const std::string nul(1, '\0');
    const auto interrupted = [](int nth, int times) { return Fault{"write", "socket", nth, times, 0, EINTR}; };
    const struct {
        const char *name;
        std::vector<Fault> faults;
        bool succeeds;
        std::string received;
    } rows[] = {
        {"no socket", {{"socket", "", 1, 1, -1, EMFILE}}, false, ""},
        {"no connection", {{"connect", "", 1, 1, -1, ECONNREFUSED}}, false, ""},
        {"no timeout for the connection", {{"setsockopt", timeout}}, true, frame},
        {"no timeout for the writes", {{"setsockopt", timeout, 2}}, false, ""},
        {"nothing accepted", {{"write", "socket", 1, 1, 0, EPIPE}}, false, ""},
        {"body not accepted", {{"write", "socket", 2, 1, 0, EPIPE}}, false, head},
        {"interrupted 3 times", {interrupted(1, 3)}, true, frame},
        {"interrupted 4 times", {interrupted(1, 4)}, false, ""},
        {"both interrupted 3 times", {interrupted(1, 3), interrupted(5, 3)}, true, frame},
        {"body interrupted 4 times", {interrupted(2, 4)}, false, head},
        {"in all 4 times", {interrupted(2, 2), interrupted(5, 2)}, false, frame.substr(0, 4 + 1024)},
        {"always gone", {{"write", "socket", 1, kAlways, -1, EPIPE}}, false, ""},
        {"body always gone", {{"write", "socket", 2, kAlways, -1, EPIPE}}, false, head},
        // A write of -1 moves back by one byte.
        {"-1 before the length", {{"write", "socket", 1, 1, -1, EAGAIN}}, true, nul + frame},
        {"-1 before the length, 3 times", {{"write", "socket", 1, 3, -1, EAGAIN}}, true, nul + nul + nul + frame},
        {"-1 between the two", {{"write", "socket", 2, 1, -1, EAGAIN}}, true, head + nul + frame.substr(4)},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        const auto descriptors = OpenDescriptors();
        const size_t connections = daemon_.Frames().size();
        for (const Fault &fault : row.faults) {
            Fail(fault);
        }
        EXPECT_EQ(row.succeeds, Send(3000));
        EXPECT_EQ(row.received, daemon_.Frames().size() > connections ? daemon_.Frames().back() : "");
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        EXPECT_EQ("", Left());
    }
}

TEST_F(DaemonSocket, BeginsNoWriteAfterNineSeconds) {
    for (const auto &[seconds, writes] : {std::pair(2, 5), std::pair(3, 3), std::pair(9, 1)}) {
        Forget();
        Fail({.call = "write", .about = "socket", .times = kAlways, .action = [passed = seconds] {
                  Script::Current().secondsPassed += passed;
              }});
        EXPECT_FALSE(Send(20000));
        EXPECT_EQ(writes, Calls("write", "socket"));
        Script::Current().Finish();
    }
}

TEST_F(DaemonSocket, IgnoresTheSignalOfADaemonThatHangsUp) {
    ASSERT_NE(SIG_ERR, std::signal(SIGPIPE, SIG_DFL));
    daemon_.Start(/*hangsUp=*/true);
    EXPECT_FALSE(Send(4000000));
    EXPECT_EQ(SIG_IGN, std::signal(SIGPIPE, SIG_IGN));
}

}  // namespace
}  // namespace fileindex_test
