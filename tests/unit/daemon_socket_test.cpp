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
    daemon_.Start();
    const std::string timeout = std::to_string(SO_SNDTIMEO);
    const struct {
        const char *name;
        Fault fault;
        bool sent;
    } rows[] = {
        {"no socket", {.call = "socket", .error = EMFILE}, false},
        {"no connection", {.call = "connect", .error = ECONNREFUSED}, false},
        {"no timeout for the connection", {.call = "setsockopt", .about = timeout}, true},
        {"no timeout for the writes", {.call = "setsockopt", .about = timeout, .nth = 2}, false},
        {"nothing accepted", {.call = "write", .about = "socket", .result = 0, .error = EPIPE}, false},
        {"body not accepted", {.call = "write", .about = "socket", .nth = 2, .result = 0, .error = EPIPE}, false},
        {"interrupted 3 times",
         {.call = "write", .about = "socket", .times = 3, .result = 0, .error = EINTR},
         true},
        {"interrupted 4 times",
         {.call = "write", .about = "socket", .times = 4, .result = 0, .error = EINTR},
         false},
        {"body interrupted 3 times",
         {.call = "write", .about = "socket", .nth = 2, .times = 3, .result = 0, .error = EINTR},
         true},
        {"always gone", {.call = "write", .about = "socket", .times = kAlways, .error = EPIPE}, false},
        {"body always gone",
         {.call = "write", .about = "socket", .nth = 2, .times = kAlways, .error = EPIPE},
         false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        const auto descriptors = OpenDescriptors();
        Fail(row.fault);
        EXPECT_EQ(row.sent, SendPause());
        EXPECT_EQ(row.sent, !daemon_.Frames().empty() && daemon_.Frames().back() == FrameOf(kPause));
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        EXPECT_EQ("", Left());
        SendCammandToDaemon("between rows", Json::Value());
    }
}

TEST_F(DaemonSocket, AWriteOfMinusOneMovesBackByOneByte) {
    const std::string frame = FrameOf(kPause);
    const struct {
        const char *name;
        int nth, times;
        std::string sent;
    } rows[] = {
        {"before the length", 1, 1, std::string(1, '\0') + frame},
        {"before the length, three times", 1, 3, std::string(3, '\0') + frame},
        {"between length and body", 2, 1, frame.substr(0, 4) + std::string(1, '\0') + frame.substr(4)},
    };
    daemon_.Start();
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Fail({.call = "write", .about = "socket", .nth = row.nth, .times = row.times, .error = EAGAIN});
        EXPECT_TRUE(SendPause());
        EXPECT_EQ(row.sent, daemon_.Frames().back());
        Script::Current().Finish();
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
