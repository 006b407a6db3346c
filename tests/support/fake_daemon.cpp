#include "fake_daemon.h"

#include "script.h"

#include <fcntl.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <cstring>

namespace fileindex_test {
namespace {

std::string TextOf(const std::string &frame) {
    std::uint32_t length = 0;
    std::memcpy(&length, frame.data(), std::min(frame.size(), sizeof length));
    const bool isWhole = length > 0 && frame.size() == sizeof length + length &&
                         frame.find('\0', sizeof length) == frame.size() - 1;
    return isWhole ? frame.substr(sizeof length, length - 1) : "malformed: " + frame;
}

}  // namespace

int FakeDaemon::Connect(int fd, const sockaddr *address) {
    const char *path = reinterpret_cast<const sockaddr_un *>(address)->sun_path;
    std::array<int, 2> ends{};
    if (listening == nullptr || std::strcmp(path, "/var/run/fileindexd.sock") != 0) {
        errno = ECONNREFUSED;
        return -1;
    }
    if (::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()) != 0 ||
        ::dup3(ends[0], fd, O_CLOEXEC) < 0) {
        return -1;
    }
    ::close(ends[0]);
    if (listening->hangs_up_) {
        return ::close(ends[1]);
    }
    listening->far_ends_[fd] = ends[1];
    return 0;
}

void FakeDaemon::Closed(int fd) {
    if (listening == nullptr || !listening->far_ends_.contains(fd)) {
        return;
    }
    const int end = listening->far_ends_.extract(fd).mapped();
    std::string frame;
    std::array<char, 4096> buffer{};
    for (ssize_t got = 0; (got = ::read(end, buffer.data(), buffer.size())) > 0;) {
        frame.append(buffer.data(), static_cast<size_t>(got));
    }
    listening->frames_.push_back(frame);
    Script::Current().Record("command " + TextOf(frame));
    ::close(end);
}

}  // namespace fileindex_test
