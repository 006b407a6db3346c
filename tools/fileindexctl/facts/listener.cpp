#include "facts/listener.h"

#include "base/unique_fd.h"

#include <linux/netlink.h>
#include <linux/rtnetlink.h>
#include <linux/sock_diag.h>
#include <linux/unix_diag.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <array>
#include <cstdint>
#include <cstring>
#include <optional>

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

Listener Match(const nlmsghdr *message, const struct stat &file) {
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
    return !isHere ? Listener::kNotSeen : isFull ? Listener::kFull : Listener::kListening;
}

}  // namespace

Listener FindListener(const std::string &path) {
    struct stat file {};
    const UniqueFd netlink(socket(AF_NETLINK, SOCK_DGRAM | SOCK_CLOEXEC, NETLINK_SOCK_DIAG));
    if (stat(path.c_str(), &file) != 0 || !netlink || !AskForListeners(netlink.Get())) {
        return Listener::kNotSeen;
    }
    alignas(nlmsghdr) std::array<char, 32768> buffer{};
    for (;;) {
        const ssize_t size = recv(netlink.Get(), buffer.data(), buffer.size(), 0);
        auto left = static_cast<unsigned>(size);
        const auto *message = reinterpret_cast<const nlmsghdr *>(buffer.data());
        if (size <= 0 || !NLMSG_OK(message, left)) {
            return Listener::kNotSeen;
        }
        for (; NLMSG_OK(message, left); message = NLMSG_NEXT(message, left)) {
            if (message->nlmsg_type != SOCK_DIAG_BY_FAMILY) {  // the end, or an error
                return Listener::kNotSeen;
            }
            const Listener found = Match(message, file);
            if (found != Listener::kNotSeen) {
                return found;
            }
        }
    }
}

}  // namespace VORK::FILEINDEXCTL
