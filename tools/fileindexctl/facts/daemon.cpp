#include "facts/daemon.h"

#include "base/unique_fd.h"

#include <fcntl.h>
#include <linux/netlink.h>
#include <linux/rtnetlink.h>
#include <linux/sock_diag.h>
#include <linux/unix_diag.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdint>
#include <cstring>

namespace VORK::FILEINDEXCTL {

namespace {

struct Request {
    nlmsghdr header;
    unix_diag_req body;
};

bool AskForListeners(int netlink) {
    Request request{};
    request.header.nlmsg_len = sizeof(request);
    request.header.nlmsg_type = SOCK_DIAG_BY_FAMILY;
    request.header.nlmsg_flags = NLM_F_REQUEST | NLM_F_DUMP;
    request.body.sdiag_family = AF_UNIX;
    request.body.udiag_states = 1U << TCP_LISTEN;
    request.body.udiag_show = UDIAG_SHOW_VFS | UDIAG_SHOW_RQLEN;
    return send(netlink, &request, sizeof(request), 0) == static_cast<ssize_t>(sizeof(request));
}

// The kernel's own numbering of devices, and 32 bits of the inode.
bool IsAt(const unix_diag_vfs &place, const struct stat &file) {
    constexpr unsigned kMinorBits = 20;
    const dev_t device =
        makedev(place.udiag_vfs_dev >> kMinorBits, place.udiag_vfs_dev & ((1U << kMinorBits) - 1));
    return place.udiag_vfs_ino == static_cast<std::uint32_t>(file.st_ino) && device == file.st_dev;
}

template <typename Payload>
std::optional<Payload> Read(const rtattr *attribute) {
    if (RTA_PAYLOAD(attribute) < sizeof(Payload)) {
        return std::nullopt;
    }
    Payload payload{};
    std::memcpy(&payload, RTA_DATA(attribute), sizeof(payload));
    return payload;
}

// What connecting to a listener leads to: 0 or, when it takes no more until it has accepted some, EAGAIN.
std::optional<int> Match(const nlmsghdr *message, const struct stat &file) {
    const auto *body = static_cast<const unix_diag_msg *>(NLMSG_DATA(message));
    const auto *attribute = reinterpret_cast<const rtattr *>(body + 1);
    auto left = static_cast<int>(NLMSG_PAYLOAD(message, sizeof(unix_diag_msg)));
    bool isHere = false;
    bool isFull = false;
    for (; RTA_OK(attribute, left); attribute = RTA_NEXT(attribute, left)) {
        if (attribute->rta_type == UNIX_DIAG_VFS) {
            const auto place = Read<unix_diag_vfs>(attribute);
            isHere = place && IsAt(*place, file);
        } else if (attribute->rta_type == UNIX_DIAG_RQLEN) {
            const auto queue = Read<unix_diag_rqlen>(attribute);
            isFull = queue && queue->udiag_rqueue > queue->udiag_wqueue;
        }
    }
    return isHere ? std::optional(isFull ? EAGAIN : 0) : std::nullopt;
}

// The same of the listener on the socket file, and not on one that has been replaced by it. Nothing when there is
// nobody, or somebody in another network namespace, or the kernel does not tell.
std::optional<int> AskKernel() {
    struct stat file {};
    const UniqueFd netlink(socket(AF_NETLINK, SOCK_DGRAM | SOCK_CLOEXEC, NETLINK_SOCK_DIAG));
    if (stat(kDaemonSocket, &file) != 0 || !netlink || !AskForListeners(netlink.Get())) {
        return std::nullopt;
    }
    alignas(nlmsghdr) std::array<char, 32768> buffer{};
    for (;;) {
        const ssize_t size = recv(netlink.Get(), buffer.data(), buffer.size(), 0);
        auto left = static_cast<unsigned>(size);
        const auto *message = reinterpret_cast<const nlmsghdr *>(buffer.data());
        if (size <= 0 || !NLMSG_OK(message, left)) {
            return std::nullopt;
        }
        for (; NLMSG_OK(message, left); message = NLMSG_NEXT(message, left)) {
            if (message->nlmsg_type != SOCK_DIAG_BY_FAMILY) {  // the end, or an error
                return std::nullopt;
            }
            if (const auto found = Match(message, file)) {
                return found;
            }
        }
    }
}

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
    const auto listener = AskKernel();
    return listener ? *listener : TryToConnect();
}

}  // namespace

DaemonState ProbeDaemon() {
    const int error = FindOut();
    const std::string why = std::string("not reachable: ") + std::strerror(error);
    switch (error) {
        case 0:
            return {"reachable", DaemonCondition::kListening, true};
        case EAGAIN:
            return {"reachable, but its backlog is full", DaemonCondition::kFull, true};
        case ENOENT:
            return {why, DaemonCondition::kAbsent, false};
        case ECONNREFUSED:
            return {why, DaemonCondition::kStale, false};
        case EACCES:
        case EPERM:
            return AskKernel()
                       ? DaemonState{"listening, but not reachable by this user", DaemonCondition::kDenied, true}
                       : DaemonState{why, DaemonCondition::kDenied, std::nullopt};
        default:
            return {why, DaemonCondition::kUnknown, std::nullopt};
    }
}

}  // namespace VORK::FILEINDEXCTL
