// The command socket: a daemon in every mood, and the writer's loop against a model of it.
#include "harness.h"
#include "scenarios.h"

#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdint>
#include <cstring>
#include <random>

namespace reliability {

namespace {

using namespace VORK::FILEINDEX;

constexpr char kReceived[] = "/tmp/received";

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
std::string Receive(int fd, size_t size) {
    std::string all;
    std::array<char, 4096> buffer{};
    ssize_t got = 0;
    while (all.size() < size && (got = ::read(fd, buffer.data(), buffer.size())) > 0) {
        all.append(buffer.data(), static_cast<size_t>(got));
    }
    return all;
}

std::string HangUp(int) {
    return "";
}

std::string Collect(int fd) {
    return Receive(fd, SIZE_MAX);
}

std::string HangUpMidFrame(int fd) {
    return Receive(fd, 2000);
}

/// Looks at nothing while the caller is there; what it sent is read when it has gone.
std::string NeverRead(int fd) {
    pollfd hungUp = {fd, POLLRDHUP, 0};
    Check(::poll(&hungUp, 1, -1) == 1, "poll");
    return Collect(fd);
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
    return first + Collect(fd);
}

enum class Bytes { kNone, kWhole, kBeginning, kOneOrMoreTwice, kAny };

bool AreRight(Bytes expected, const std::string &received, const std::string &frame) {
    switch (expected) {
        case Bytes::kNone:
            return received.empty();
        case Bytes::kWhole:
            return received == frame;
        case Bytes::kBeginning:
            return received.size() < frame.size() && frame.starts_with(received);
        case Bytes::kOneOrMoreTwice:  // each timeout sends the byte before it again; in the body all are alike
            return received.size() > frame.size() && received.starts_with(frame.substr(0, 2000)) &&
                   received.ends_with(frame.substr(frame.size() - 2000)) &&
                   received.find_first_not_of('b', 20) >= received.size() - 20;
        default:
            return true;
    }
}

struct Mood {
    const char *name;
    std::string (*serve)(int fd);
    size_t bodySize;
    bool sent;
    Bytes bytes;
};

constexpr size_t kShort = 10;
constexpr size_t kLong = 4194304;  // 4 MiB

constexpr Mood kMoods[] = {
    {"reads, short frame", Collect, kShort, true, Bytes::kWhole},
    {"reads, 4 MiB frame", Collect, kLong, true, Bytes::kWhole},
    {"hangs up at once", HangUp, kLong, false, Bytes::kAny},
    {"hangs up mid-frame", HangUpMidFrame, kLong, false, Bytes::kBeginning},
    {"never reads, short frame", NeverRead, kShort, true, Bytes::kWhole},
    {"never reads, 4 MiB frame", NeverRead, kLong, false, Bytes::kBeginning},
    {"sleeps mid-frame", FallAsleep, kLong, true, Bytes::kOneOrMoreTwice},
};

void SendMust(bool sent, size_t bodySize, const std::string &mood) {
    const SameDescriptors sameDescriptors;
    const Stopwatch stopwatch;
    ::alarm(60);  // a call that hangs ends the run
    Check(Send(bodySize) == sent, mood + ": the result");
    ::alarm(0);
    Figure("daemon " + mood, std::string(sent ? "true" : "false") + " after " +
                                 std::to_string(static_cast<int>(stopwatch.Milliseconds())) + " ms");
}

void TryMood(const Mood &mood) {
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
    Check(AreRight(mood.bytes, ReadFile(kReceived).value_or("?"), FrameOf(mood.bodySize)),
          std::string(mood.name) + ": the bytes");
}

/// Nobody accepts, and more callers wait than the backlog holds.
void TryFullBacklog() {
    std::vector<int> open = {Listen(0)};
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kSocket, sizeof kSocket);
    do {
        open.push_back(::socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0));
    } while (::connect(open.back(), reinterpret_cast<const sockaddr *>(&address), sizeof address) == 0);
    SendMust(false, kShort, "with a full backlog");
    for (const int fd : open) {
        ::close(fd);
    }
}

// --- model -----------------------------------------------------------------------------------------------------

struct Answer {
    ssize_t result;
    int error;
};

/// What `write` answers, call for call, decided by a seed.
class Dice {
public:
    explicit Dice(unsigned seed) : random_(seed), mood_(random_() % 100) {}

    Answer Roll(size_t asked) {
        constexpr int kErrors[] = {EAGAIN, EPIPE, EINTR};
        const unsigned roll = random_() % 100;
        const int error = kErrors[random_() % 3];
        if (mood_ == 0 || roll < (mood_ < 50 ? 2U : mood_)) {
            return {-1, error};
        }
        if (roll % 10 == 9) {
            return {0, random_() % 4 == 0 ? error : EINTR};
        }
        const bool isWhole = roll % 2 == 0;
        return {static_cast<ssize_t>(isWhole ? asked : 1 + random_() % asked), error};
    }

private:
    std::mt19937 random_;
    const unsigned mood_;  ///< 0 is a dead peer
};

struct Transcript {
    std::string bytes;
    long calls = 0;
    bool sent = false;

    bool operator==(const Transcript &) const = default;

    ssize_t Play(Dice &dice, const char *data, size_t size) {
        const Answer answer = dice.Roll(size);
        ++calls;
        if (answer.result > 0) {
            bytes.append(data, static_cast<size_t>(answer.result));
        }
        errno = answer.error;
        return answer.result;
    }
};

/// Sends the bytes of `tape` from `head` on; -1 is a step back, and the tape's beginning ends the attempt.
bool ModelWriteAll(const std::string &tape, size_t head, size_t size, Dice &dice, Transcript &transcript) {
    size_t remaining = size;
    int interruptions = 0;
    while (remaining > 0) {
        const ssize_t result = transcript.Play(dice, tape.data() + head, std::min<size_t>(remaining, 1024));
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

Transcript Model(unsigned seed, size_t bodySize) {
    constexpr size_t kZeros = 65536;
    const std::string frame = FrameOf(bodySize);
    const std::string tape = std::string(kZeros, '\0') + frame;
    Dice dice(seed);
    Transcript transcript;
    transcript.sent = ModelWriteAll(tape, kZeros, 4, dice, transcript) &&
                      ModelWriteAll(tape, kZeros + 4, frame.size() - 4, dice, transcript);
    return transcript;
}

Transcript Library(unsigned seed, size_t bodySize) {
    Dice dice(seed);
    Transcript transcript;
    WriteHook() = [&](int, const void *data, size_t size) {
        return transcript.Play(dice, static_cast<const char *>(data), size);
    };
    transcript.sent = Send(bodySize);
    WriteHook() = nullptr;
    return transcript;
}

}  // namespace

void Moods() {
    ::unlink(kSocket);
    SendMust(false, kShort, "absent");
    ::close(Listen(-1));
    SendMust(false, kShort, "gone, its socket left");
    for (const Mood &mood : kMoods) {
        TryMood(mood);
    }
    TryFullBacklog();
}

void WriterModel() {
    const pid_t daemon = StartDaemon();
    const int sequences = Rounds(10000, 100000);
    std::mt19937 random(1);
    int sent = 0;
    long calls = 0;
    for (int i = 0; i < sequences; ++i) {
        const unsigned seed = random();
        const size_t bodySize = random() % 5000;
        const Transcript expected = Model(seed, bodySize);
        Check(Library(seed, bodySize) == expected, "the loop and its model differ, seed " + std::to_string(seed));
        sent += expected.sent ? 1 : 0;
        calls += expected.calls;
    }
    Kill(daemon);
    Check(sent > sequences / 10 && sent < sequences, "the sequences are all of one kind");
    Figure("socket writer against its model", std::to_string(sequences) + " sequences, " + std::to_string(calls) +
                                                  " writes: same bytes, same result (" + std::to_string(sent) +
                                                  " sent)");
}

}  // namespace reliability
