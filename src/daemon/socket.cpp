#include "base/json/text.h"
#include "base/unique_fd.h"
#include "names.h"
#include "no_throw.h"

#include <fileindex/daemon.h>

#include <sys/socket.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

constexpr std::size_t kChunkSize = 1024;
constexpr int kEmptyWriteRetries = 3;
constexpr std::ptrdiff_t kBackwardRoom = 64 * 1024;
constexpr timeval kSendTimeout = {1, 0};
constexpr std::chrono::seconds kWholeSendLimit(10);
constexpr std::chrono::seconds kLastWrite = kWholeSendLimit - std::chrono::seconds(kSendTimeout.tv_sec);

/// A frame as it goes over the wire: 4 bytes of length in host order, the JSON text and a NUL, both counted by
/// the length. In front of it lie zeros that belong to the same buffer; see WriteAll.
class Frame {
public:
    explicit Frame(const std::string &text) {
        const auto length = static_cast<std::uint32_t>(text.size() + 1);
        bytes_.reserve(sizeof(length) + length);
        bytes_.append(reinterpret_cast<const char *>(&length), sizeof(length));
        bytes_.append(text.c_str(), length);
    }

    static constexpr std::size_t kLengthSize = sizeof(std::uint32_t);
    std::size_t Size() const { return bytes_.size() - zeros_; }

    /// The bytes from an offset to the end. A negative offset points into the zeros before the frame; they are
    /// made when one is first asked for, which is rare.
    const char *At(std::ptrdiff_t offset) {
        if (offset < 0 && zeros_ == 0) {
            bytes_.insert(0, kBackwardRoom, '\0');
            zeros_ = kBackwardRoom;
        }
        return bytes_.data() + static_cast<std::ptrdiff_t>(zeros_) + offset;
    }

private:
    std::string bytes_;
    std::size_t zeros_ = 0;
};

using Clock = std::chrono::steady_clock;

/// Writes the frame's bytes [offset, offset + size) in chunks. The result of a failed write, -1, is added like any
/// other: the next write begins one byte earlier, and one byte more is left to write. Every release has done so,
/// and what a daemon has to find its way in must not change. A write that would begin before the zeros is not made
/// and ends the frame; when the peer is gone, that is soon. With a peer that does not read, or reads slowly, a
/// write can take as long as the timeout, hence the deadline: no write begins after it.
bool WriteAll(int fd, std::size_t size, Frame &frame, std::ptrdiff_t offset, Clock::time_point deadline) {
    std::size_t remaining = size;
    int retries = kEmptyWriteRetries;
    while (remaining > 0) {
        if (Clock::now() >= deadline) {
            return false;
        }
        const ssize_t count = write(fd, frame.At(offset), std::min(remaining, kChunkSize));
        if (count == 0) {
            if (errno != EINTR || retries == 0) {
                return false;
            }
            --retries;
            continue;
        }
        if (count < 0 && offset == -kBackwardRoom) {
            return false;
        }
        remaining -= static_cast<std::size_t>(count);
        offset += count;
    }
    return true;
}

bool LimitSends(int fd) {
    return setsockopt(fd, SOL_SOCKET, SO_SNDTIMEO, &kSendTimeout, sizeof(kSendTimeout)) == 0;
}

bool Connect(int fd) {
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    static_assert(sizeof(kDaemonSocket) <= sizeof(address.sun_path));
    std::memcpy(address.sun_path, kDaemonSocket, sizeof(kDaemonSocket));
    return connect(fd, reinterpret_cast<const sockaddr *>(&address), sizeof(address)) == 0;
}

}  // namespace

bool SendCammandToDaemon(const std::string &command, const Json::Value &data) {
    return NoThrow([&] {
        const Clock::time_point deadline = Clock::now() + kLastWrite;
        // For the whole process and for good: a daemon that hangs up must not kill a management program.
        signal(SIGPIPE, SIG_IGN);
        if (!CanBeWritten(data, 1)) {
            return false;
        }
        const UniqueFd fd(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
        if (!fd) {
            return false;
        }
        (void)LimitSends(fd.Get());  // bounds the connect to a daemon with a full backlog
        if (!Connect(fd.Get()) || !LimitSends(fd.Get())) {
            return false;
        }
        // As ToString writes {"type": command, "data": data}, without a copy of the data.
        std::string text = "{\"data\":" + ToString(data) + ",\"type\":";
        AppendQuoted(text, command);
        Frame frame(text + "}");
        return WriteAll(fd.Get(), Frame::kLengthSize, frame, 0, deadline) &&
               WriteAll(fd.Get(), frame.Size() - Frame::kLengthSize, frame, Frame::kLengthSize, deadline);
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
