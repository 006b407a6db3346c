// The command socket: a daemon in every mood, and the writer's loop against a model of it.
#include "harness.h"

#include <poll.h>
#include <sys/socket.h>

#include <cerrno>
#include <cstdint>

namespace reliability {

namespace {

std::string FrameOf(size_t bodySize) {
    const std::string text = R"({"data":")" + std::string(bodySize, 'b') + R"(","type":"command"})";
    const auto length = static_cast<std::uint32_t>(text.size() + 1);
    std::string frame(reinterpret_cast<const char *>(&length), sizeof length);
    return frame + text + '\0';
}

bool Send(size_t bodySize) {
    return SendCammandToDaemon("command", std::string(bodySize, 'b'));
}

// --- moods -----------------------------------------------------------------------------------------------------

/// Reads up to `size` bytes, or until the other end is closed.
std::string Receive(int fd, size_t size = SIZE_MAX) {
    std::string all;
    std::array<char, 4096> buffer{};
    ssize_t got = 0;
    while (all.size() < size && (got = ::read(fd, buffer.data(), buffer.size())) > 0) {
        all.append(buffer.data(), static_cast<size_t>(got));
    }
    return all;
}

/// Looks at nothing while the caller is there; what it sent is read when it has gone.
std::string NeverRead(int fd) {
    pollfd hungUp = {fd, POLLRDHUP, 0};
    Check(::poll(&hungUp, 1, -1) == 1, "poll");
    return Receive(fd);
}

/// Writes of the caller that ended with -1, the send timeout among them.
std::atomic<int> &FailedWrites() {
    static auto &count = Shared<std::atomic<int>>();
    return count;
}

/// Reads on only after the caller has met its send timeout.
std::string FallAsleep(int fd) {
    const std::string first = Receive(fd, 2000);
    while (FailedWrites() == 0) {
        ::usleep(1000);
    }
    return first + Receive(fd);
}

/// Would need longer for a long frame than a send may take.
std::string ReadSlowly(int fd) {
    std::string all;
    pollfd hungUp = {fd, POLLRDHUP, 0};
    while (::poll(&hungUp, 1, 20) == 0) {
        all += Receive(fd, 1);
    }
    return all + Receive(fd);
}

/// What the daemon received, beside the frame.
using Comparison = bool (*)(const std::string &received, const std::string &frame);

constexpr Comparison kWhole = [](auto &received, auto &frame) { return received == frame; };
constexpr Comparison kBeginning = [](auto &received, auto &frame) {
    return received.size() < frame.size() && frame.starts_with(received);
};
/// Each timeout sends the byte before it again; in the body all are alike.
constexpr Comparison kSomeTwice = [](auto &received, auto &frame) {
    return received.size() > frame.size() && received.starts_with(frame.substr(0, 2000)) &&
           received.ends_with(frame.substr(frame.size() - 2000)) &&
           received.find_first_not_of('b', 20) >= received.size() - 20;
};

constexpr size_t kShort = 10;
constexpr size_t kLong = 4194304;  // 4 MiB

constexpr struct Mood {
    const char *name;
    std::string (*serve)(int fd);
    size_t bodySize;
    bool sent;
    Comparison isRight;
} kMoods[] = {
    {"reads, short frame", [](int fd) { return Receive(fd); }, kShort, true, kWhole},
    {"reads, 4 MiB frame", [](int fd) { return Receive(fd); }, kLong, true, kWhole},
    {"hangs up at once", [](int) { return std::string(); }, kLong, false, kBeginning},
    {"hangs up mid-frame", [](int fd) { return Receive(fd, 2000); }, kLong, false, kBeginning},
    {"never reads, short frame", NeverRead, kShort, true, kWhole},
    {"never reads, 4 MiB frame", NeverRead, kLong, false, kBeginning},
    {"reads slowly, 4 MiB frame", ReadSlowly, kLong, false, kBeginning},
    {"sleeps mid-frame", FallAsleep, kLong, true, kSomeTwice},
};

void SendMust(bool sent, size_t bodySize, const std::string &mood) {
    const SameDescriptors sameDescriptors;
    const double begin = Now();
    ::alarm(60);  // a call that hangs ends the run
    Check(Send(bodySize) == sent, mood + ": the result");
    ::alarm(0);
    Figure("daemon %s | %s after %.0f ms", mood.c_str(), sent ? "true" : "false", (Now() - begin) * 1000);
}

void TryMood(const Mood &mood) {
    constexpr char kReceived[] = "/tmp/received";
    FailedWrites() = 0;
    const int listener = Listen(8);
    const pid_t peer = Start([&] {
        const int fd = ::accept(listener, nullptr, nullptr);
        WriteFile(kReceived, mood.serve(fd));
        ::close(fd);
    });
    ::close(listener);
    WriteHook() = [](int fd, const void *data, size_t size) {
        const ssize_t result = RealWrite(fd, data, size);
        FailedWrites() += result < 0 ? 1 : 0;
        return result;
    };
    SendMust(mood.sent, mood.bodySize, mood.name);
    WriteHook() = nullptr;
    Check(Wait(peer) == 0, "the peer failed");
    Check(mood.isRight(ReadFile(kReceived).value_or("?"), FrameOf(mood.bodySize)),
          std::string(mood.name) + ": the bytes");
}

/// Nobody accepts, and more callers wait than the backlog holds.
void TryFullBacklog() {
    std::vector<int> open = {Listen(0)};
    const sockaddr_un address = SocketAddress();
    do {
        open.push_back(::socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0));
    } while (::connect(open.back(), reinterpret_cast<const sockaddr *>(&address), sizeof address) == 0);
    SendMust(false, kShort, "with a full backlog");
    std::for_each(open.begin(), open.end(), ::close);
}

// --- model -----------------------------------------------------------------------------------------------------

/// A peer that answers `write` as a seed decides, after a time, and keeps what it took.
class Peer {
public:
    explicit Peer(unsigned seed) : random_(seed), mood_(random_() % 100), isSlow_(random_() % 4 == 0) {}

    ssize_t Write(const char *data, size_t size) {
        ++calls;
        clock += isSlow_ ? random_() % 4 * 0.25 : 0;
        const ssize_t result = Roll(size);
        if (result > 0) {
            bytes.append(data, static_cast<size_t>(result));
        }
        return result;
    }

    std::string bytes;
    double clock = 0;
    long calls = 0;
    bool sent = false;

private:
    ssize_t Roll(size_t asked) {
        constexpr int kErrors[] = {EAGAIN, EPIPE, EINTR};
        const unsigned roll = random_() % 100;
        errno = kErrors[random_() % 3];
        if (mood_ == 0 || roll < (mood_ < 50 ? 2U : mood_)) {
            return -1;
        }
        if (roll % 10 == 9) {
            errno = random_() % 4 == 0 ? errno : EINTR;
            return 0;
        }
        return static_cast<ssize_t>(roll % 2 == 0 ? asked : 1 + random_() % asked);
    }

    std::mt19937 random_;
    const unsigned mood_;  ///< 0 is a dead peer
    const bool isSlow_;
};

/// Sends the bytes of `tape` from `head` on; -1 is a step back, and the tape's beginning ends the attempt. So do
/// nine seconds since the call.
bool ModelWriteAll(const std::string &tape, size_t head, size_t size, Peer &peer) {
    size_t remaining = size;
    int interruptions = 0;
    while (remaining > 0) {
        if (peer.clock >= 9) {
            return false;
        }
        const ssize_t result = peer.Write(tape.data() + head, std::min<size_t>(remaining, 1024));
        if (result == 0 && (errno != EINTR || ++interruptions > 3)) {
            return false;
        }
        if (result == -1 && head == 0) {
            return false;
        }
        head += static_cast<size_t>(result);
        remaining -= static_cast<size_t>(result);
    }
    return true;
}

Peer Model(unsigned seed, size_t bodySize) {
    constexpr size_t kZeros = 65536;
    const std::string frame = FrameOf(bodySize);
    const std::string tape = std::string(kZeros, '\0') + frame;
    Peer peer(seed);
    peer.sent = ModelWriteAll(tape, kZeros, 4, peer) && ModelWriteAll(tape, kZeros + 4, frame.size() - 4, peer);
    return peer;
}

Peer Library(unsigned seed, size_t bodySize) {
    Peer peer(seed);
    WriteHook() = [&](int, const void *data, size_t size) {
        return peer.Write(static_cast<const char *>(data), size);
    };
    ClockHook() = [&] { return peer.clock; };
    peer.sent = Send(bodySize);
    WriteHook() = nullptr;
    ClockHook() = nullptr;
    return peer;
}

}  // namespace

void Moods(const std::string &) {
    ::unlink(kSocket);
    SendMust(false, kShort, "absent");
    ::close(Listen(-1));
    SendMust(false, kShort, "gone, its socket left");
    for (const Mood &mood : kMoods) {
        TryMood(mood);
    }
    TryFullBacklog();
}

void WriterModel(const std::string &) {
    const pid_t daemon = StartDaemon();
    const int sequences = Rounds(10000, 100000);
    std::mt19937 random(1);
    int sent = 0;
    int late = 0;
    long calls = 0;
    for (int i = 0; i < sequences; ++i) {
        const unsigned seed = random();
        const size_t bodySize = random() % 5000;
        const Peer expected = Model(seed, bodySize);
        const Peer met = Library(seed, bodySize);
        Check(met.bytes == expected.bytes && met.calls == expected.calls && met.sent == expected.sent,
              "the loop and its model differ, seed " + std::to_string(seed));
        sent += expected.sent ? 1 : 0;
        late += expected.clock >= 9 ? 1 : 0;
        calls += expected.calls;
    }
    Kill(daemon);
    Check(sent > sequences / 10 && sent < sequences && late > 0, "the sequences are all of one kind");
    Figure(
        "socket writer against its model | %d sequences, %ld writes: same bytes, same result (%d sent, %d late)",
        sequences, calls, sent, late);
}

}  // namespace reliability
