#include "json/text.h"
#include "names.h"
#include "no_throw.h"
#include "scoped.h"

#include <fileindex/daemon.h>

#include <sys/socket.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdint>
#include <cstring>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

constexpr std::size_t kChunkSize = 1024;
constexpr int kEmptyWriteRetries = 3;
constexpr std::size_t kBackwardRoom = 64 * 1024;
constexpr timeval kSendTimeout = {1, 0};
constexpr std::chrono::seconds kWholeSendLimit(10);

/// A frame as it goes over the wire: 4 bytes of length in host order, the JSON text and a NUL, both counted by
/// the length. In front of it lie zeros that belong to the same buffer; see WriteAll.
class Frame {
public:
    explicit Frame(const std::string &text) : buffer_(kBackwardRoom, '\0') {
        const auto length = static_cast<std::uint32_t>(text.size() + 1);
        buffer_.append(reinterpret_cast<const char *>(&length), sizeof(length));
        buffer_.append(text.c_str(), text.size() + 1);
    }

    const char *Floor() const { return buffer_.data(); }
    const char *Length() const { return buffer_.data() + kBackwardRoom; }
    const char *Body() const { return Length() + kLengthSize; }
    std::size_t BodySize() const { return buffer_.size() - kBackwardRoom - kLengthSize; }

    static constexpr std::size_t kLengthSize = sizeof(std::uint32_t);

private:
    std::string buffer_;
};

using Clock = std::chrono::steady_clock;

/// Writes in chunks. A result of -1 counts like any other: the position moves back by a byte and one more is to
/// be written. The daemon has always been spoken to like this, and frames that it resynchronises on must not
/// change. The step back may go down to `floor`; beyond it the frame is given up, which soon ends the loop when
/// the peer is gone. A peer that is there and does not read costs a timeout for each step, hence the deadline.
bool WriteAll(int fd, std::size_t size, const char *buffer, const char *floor, Clock::time_point deadline) {
    const char *position = buffer;
    std::size_t remaining = size;
    int retries = kEmptyWriteRetries;
    while (remaining > 0) {
        const ssize_t count = write(fd, position, std::min(remaining, kChunkSize));
        if (count == 0) {
            if (errno != EINTR || retries == 0) {
                return false;
            }
            --retries;
            continue;
        }
        if (count < 0 && (position == floor || (errno == EAGAIN && Clock::now() >= deadline))) {
            return false;
        }
        remaining -= static_cast<std::size_t>(count);
        position += count;
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
        // For the whole process and for good: a daemon that hangs up must not kill a management program.
        signal(SIGPIPE, SIG_IGN);
        const UniqueFd fd(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
        if (!fd) {
            return false;
        }
        (void)LimitSends(fd.Get());  // bounds the connect to a daemon with a full backlog
        if (!Connect(fd.Get()) || !LimitSends(fd.Get())) {
            return false;
        }
        Json::Value message(Json::objectValue);
        message["type"] = command;
        message[kDataKey] = data;
        const Frame frame(ToString(message));
        const Clock::time_point deadline = Clock::now() + kWholeSendLimit;
        return WriteAll(fd.Get(), Frame::kLengthSize, frame.Length(), frame.Floor(), deadline) &&
               WriteAll(fd.Get(), frame.BodySize(), frame.Body(), frame.Floor(), deadline);
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
