// Commands to the daemon's socket.
#include "fixture.h"

#include <sys/socket.h>

#include <cerrno>
#include <csignal>
#include <cstdint>
#include <cstring>
#include <string>

namespace fileindex_test {
namespace {

std::string FrameOf(const std::string &text) {
    const auto length = static_cast<std::uint32_t>(text.size() + 1);
    std::string frame(sizeof length, '\0');
    std::memcpy(frame.data(), &length, sizeof length);
    return frame + text + '\0';
}

const std::string kPause = R"({"data":{"resume_time":0},"type":"pause"})";

class DaemonSocket : public FileIndexTest {
protected:
    static bool SendPause() { return SendCammandToDaemon("pause", Parse(R"({"resume_time":0})")); }
};

TEST_F(DaemonSocket, CarriesOneFrameForEachCommand) {
    daemon_.Start();
    EXPECT_TRUE(SendPause());
    EXPECT_TRUE(SendCammandToDaemon("x\xff", Json::Value()));
    EXPECT_THAT(daemon_.Frames(), ElementsAre(FrameOf(kPause), FrameOf("{\"data\":null,\"type\":\"x\xff\"}")));
    EXPECT_EQ(2, Script::Current().Calls("connect", "110")) << "the size of the whole address";
    EXPECT_EQ("", Left());
}

TEST_F(DaemonSocket, WritesABodyInChunksOf1024Bytes) {
    daemon_.Start();
    EXPECT_TRUE(SendCammandToDaemon("large", std::string(5000, 'x')));
    const std::string text = R"({"data":")" + std::string(5000, 'x') + R"(","type":"large"})";
    EXPECT_THAT(daemon_.Frames(), ElementsAre(FrameOf(text)));
    EXPECT_EQ(1, Script::Current().Calls("write", "] 4")) << "the length";
    EXPECT_EQ(4, Script::Current().Calls("write", "] 1024"));
    EXPECT_EQ(1, Script::Current().Calls("write", "] " + std::to_string(text.size() + 1 - size_t{4} * 1024)));
}

TEST_F(DaemonSocket, FailsWhenAStepDoes) {
    const std::string timeout = std::to_string(SO_SNDTIMEO);
    const std::string frame = FrameOf(kPause);
    const std::string head = frame.substr(0, 4);
    const std::string nul(1, '\0');
    const struct {
        const char *name;
        Fault fault;
        bool succeeds;
        std::string received;
    } rows[] = {
        {"no socket", {"socket", "", 1, 1, -1, EMFILE}, false, ""},
        {"no connection", {"connect", "", 1, 1, -1, ECONNREFUSED}, false, ""},
        {"no timeout for the connection", {"setsockopt", timeout}, true, frame},
        {"no timeout for the writes", {"setsockopt", timeout, 2}, false, ""},
        {"nothing accepted", {"write", "socket", 1, 1, 0, EPIPE}, false, ""},
        {"body not accepted", {"write", "socket", 2, 1, 0, EPIPE}, false, head},
        {"interrupted 3 times", {"write", "socket", 1, 3, 0, EINTR}, true, frame},
        {"interrupted 4 times", {"write", "socket", 1, 4, 0, EINTR}, false, ""},
        {"body interrupted 3 times", {"write", "socket", 2, 3, 0, EINTR}, true, frame},
        {"always gone", {"write", "socket", 1, kAlways, -1, EPIPE}, false, ""},
        {"body always gone", {"write", "socket", 2, kAlways, -1, EPIPE}, false, head},
        // A write of -1 moves back by one byte.
        {"-1 before the length", {"write", "socket", 1, 1, -1, EAGAIN}, true, nul + frame},
        {"-1 before the length, 3 times", {"write", "socket", 1, 3, -1, EAGAIN}, true, nul + nul + nul + frame},
        {"-1 between length and body", {"write", "socket", 2, 1, -1, EAGAIN}, true, head + nul + frame.substr(4)},
    };
    daemon_.Start();
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        const auto descriptors = OpenDescriptors();
        Fail(row.fault);
        const size_t connections = daemon_.Frames().size();
        EXPECT_EQ(row.succeeds, SendPause());
        EXPECT_EQ(row.received, daemon_.Frames().size() > connections ? daemon_.Frames().back() : "");
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        EXPECT_EQ("", Left());
    }
}

TEST_F(DaemonSocket, IgnoresTheSignalOfADaemonThatHangsUp) {
    ASSERT_NE(SIG_ERR, std::signal(SIGPIPE, SIG_DFL));
    daemon_.Start(/*hangsUp=*/true);
    EXPECT_FALSE(SendCammandToDaemon("large", std::string(4000000, 'x')));
    EXPECT_EQ(SIG_IGN, std::signal(SIGPIPE, SIG_IGN));
}

}  // namespace
}  // namespace fileindex_test
