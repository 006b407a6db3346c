#include "facts/daemon.h"

#include "base/unique_fd.h"
#include "facts/listener.h"

#include <fcntl.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace VORK::FILEINDEXCTL {

namespace {

// 0 or an error number. Does not wait.
int TryToConnect() {
    const UniqueFd descriptor(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::strncpy(address.sun_path, kDaemonSocket, sizeof(address.sun_path) - 1);
    const bool connected = descriptor && connect(descriptor.Get(), reinterpret_cast<const sockaddr *>(&address),
                                                 sizeof(address)) == 0;
    return connected ? 0 : errno;
}

// What connecting would lead to.
int FindOut() {
    if (faccessat(AT_FDCWD, kDaemonSocket, W_OK, AT_EACCESS) != 0) {
        return errno;
    }
    switch (FindListener(kDaemonSocket)) {
        case Listener::kListening:
            return 0;
        case Listener::kFull:
            return EAGAIN;
        case Listener::kNotSeen:
            break;
    }
    return TryToConnect();
}

DaemonCondition ConditionOf(int error) {
    switch (error) {
        case ENOENT:
            return DaemonCondition::kAbsent;
        case ECONNREFUSED:
            return DaemonCondition::kStale;
        case EACCES:
        case EPERM:
            return DaemonCondition::kDenied;
        default:
            return DaemonCondition::kUnknown;
    }
}

}  // namespace

DaemonState ProbeDaemon() {
    const int error = FindOut();
    if (error == 0) {
        return {"reachable", DaemonCondition::kListening, true};
    }
    if (error == EAGAIN) {
        return {"reachable, but its backlog is full", DaemonCondition::kFull, true};
    }
    const DaemonCondition condition = ConditionOf(error);
    if (condition == DaemonCondition::kDenied && FindListener(kDaemonSocket) != Listener::kNotSeen) {
        return {"listening, but not reachable by this user", condition, true};
    }
    const bool none = condition == DaemonCondition::kAbsent || condition == DaemonCondition::kStale;
    return {std::string("not reachable: ") + std::strerror(error), condition,
            none ? std::optional(false) : std::nullopt};
}

}  // namespace VORK::FILEINDEXCTL
