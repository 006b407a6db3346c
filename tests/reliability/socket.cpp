// The command socket: a daemon in every mood, and the writer's loop against a model of it.
#include "harness.h"

#include <poll.h>
#include <sys/socket.h>
#include <sys/syscall.h>

#include <algorithm>
#include <cstdint>
#include <ctime>

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

/// Called in the place of `write` in this process, the library's own calls included; none at first.
std::function<ssize_t(int fd, const void *data, size_t size)> &WriteHook() {
    static std::function<ssize_t(int, const void *, size_t)> hook;
    return hook;
}

/// The seconds that the steady clock shows in this process; its own when there is no such function, as at first.
std::function<double()> &ClockHook() {
    static std::function<double()> hook;
    return hook;
}

/// Writes of the caller that ended with -1, the send timeout among them.
std::atomic<int> &FailedWrites() {
    static auto &count = Shared<std::atomic<int>>();
    return count;
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

/// Reads on only after the caller has met its send timeout.
std::string FallAsleep(int fd) {
    const std::string first = Receive(fd, 2000);
    while (FailedWrites() == 0) {
        ::usleep(1000);
    }
    return first + Receive(fd);
}

constexpr size_t kShort = 10;
constexpr size_t kLong = 4194304;  // 4 MiB

/// What the daemon received, beside the frame.
constexpr struct Mood {
    const char *name;
    std::string (*serve)(int fd);
    bool sent;
    bool (*isRight)(const std::string &received, const std::string &frame);
} kMoods[] = {
    {"reads", [](int fd) { return Receive(fd); }, true,
     [](auto &received, auto &frame) { return received == frame; }},
    {"hangs up mid-frame", [](int fd) { return Receive(fd, 2000); }, false,
     [](auto &received, auto &frame) { return frame.starts_with(received); }},
    {"never reads", NeverRead, false, [](auto &received, auto &frame) { return frame.starts_with(received); }},
    // Each timeout sends the byte before it again; in the body all are alike.
    {"sleeps mid-frame", FallAsleep, true,
     [](auto &received, auto &frame) {
         return received.size() > frame.size() && received.starts_with(frame.substr(0, 2000)) &&
                received.ends_with(frame.substr(frame.size() - 2000)) &&
                received.find_first_not_of('b', 20) >= received.size() - 20;
     }},
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
    const pid_t peer = Start([&] { WriteFile(kReceived, mood.serve(::accept(listener, nullptr, nullptr))); });
    ::close(listener);
    WriteHook() = [](int fd, const void *data, size_t size) {
        const ssize_t result = ::syscall(SYS_write, fd, data, size);
        FailedWrites() += result < 0 ? 1 : 0;
        return result;
    };
    SendMust(mood.sent, kLong, mood.name);
    WriteHook() = nullptr;
    Check(Wait(peer) == 0, "the peer failed");
    Check(mood.isRight(ReadFile(kReceived), FrameOf(kLong)), std::string(mood.name) + ": the bytes");
}

/// Nobody accepts, and more callers wait than the backlog holds: children, each of which has to give up.
void TryFullBacklog() {
    const int listener = Listen(0);
    const pid_t first = Start([] { Check(Send(kShort), "the backlog takes one"); });
    Check(Wait(first) == 0, "the first caller");
    SendMust(false, kShort, "with a full backlog");
    ::close(listener);
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

extern "C" int clock_gettime(clockid_t clock, timespec *now) noexcept {
    const auto &hook = reliability::ClockHook();
    if (clock != CLOCK_MONOTONIC || !hook) {
        return static_cast<int>(::syscall(SYS_clock_gettime, clock, now));
    }
    const double seconds = hook();
    *now = {static_cast<time_t>(seconds), static_cast<long>(seconds * 1e9) % 1000000000};
    return 0;
}

extern "C" ssize_t write(int fd, const void *data, size_t size) {
    const auto &hook = reliability::WriteHook();
    return hook ? hook(fd, data, size) : ::syscall(SYS_write, fd, data, size);
}
