#include "daemon.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace fileindexctl {

namespace {

constexpr const char *kSocket = "/var/run/fileindexd.sock";

}  // namespace

DaemonState ProbeDaemon() {
    const int descriptor = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    if (descriptor < 0) {
        return {false, std::string("cannot be asked: ") + std::strerror(errno)};
    }
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::strncpy(address.sun_path, kSocket, sizeof(address.sun_path) - 1);
    const bool connected = connect(descriptor, reinterpret_cast<const sockaddr *>(&address), sizeof(address)) == 0;
    const int error = connected ? 0 : errno;
    close(descriptor);
    if (connected) {
        return {true, "reachable"};
    }
    if (error == EAGAIN) {
        return {true, "reachable, but its backlog is full"};
    }
    return {false, std::string("not reachable: ") + std::strerror(error)};
}

}  // namespace fileindexctl
