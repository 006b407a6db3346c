#include "daemon.h"

#include "descriptor.h"
#include "listener.h"

#include <fcntl.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace fileindexctl {

namespace {

// 0 or an error number. Does not wait.
int TryToConnect() {
    const Descriptor descriptor(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
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
        case Listener::Listening:
            return 0;
        case Listener::Full:
            return EAGAIN;
        case Listener::NotSeen:
            break;
    }
    return TryToConnect();
}

DaemonCondition ConditionOf(int error) {
    switch (error) {
        case ENOENT:
            return DaemonCondition::Absent;
        case ECONNREFUSED:
            return DaemonCondition::Stale;
        case EACCES:
        case EPERM:
            return DaemonCondition::Denied;
        default:
            return DaemonCondition::Unknown;
    }
}

}  // namespace

DaemonState ProbeDaemon() {
    const int error = FindOut();
    if (error == 0) {
        return {"reachable", DaemonCondition::Listening, true};
    }
    if (error == EAGAIN) {
        return {"reachable, but its backlog is full", DaemonCondition::Full, true};
    }
    const DaemonCondition condition = ConditionOf(error);
    if (condition == DaemonCondition::Denied && FindListener(kDaemonSocket) != Listener::NotSeen) {
        return {"listening, but not reachable by this user", condition, true};
    }
    const bool none = condition == DaemonCondition::Absent || condition == DaemonCondition::Stale;
    return {std::string("not reachable: ") + std::strerror(error), condition,
            none ? std::optional(false) : std::nullopt};
}

}  // namespace fileindexctl
