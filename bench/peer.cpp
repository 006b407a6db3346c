#include "peer.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <cstring>
#include <stdexcept>

namespace bench {

namespace {

constexpr char kSocket[] = "/var/run/fileindexd.sock";

}  // namespace

Peer::Peer() : listener_(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    std::strcpy(address.sun_path, kSocket);
    unlink(kSocket);
    if (bind(listener_, reinterpret_cast<const sockaddr *>(&address), sizeof(address)) != 0 ||
        listen(listener_, 64) != 0) {
        throw std::runtime_error("cannot listen on the daemon's socket");
    }
    server_ = std::thread([this] { Serve(); });
}

Peer::~Peer() {
    shutdown(listener_, SHUT_RDWR);
    server_.join();
    close(listener_);
    unlink(kSocket);
}

void Peer::Serve() const {
    std::array<char, 4096> buffer;
    for (;;) {
        const int connection = accept4(listener_, nullptr, nullptr, SOCK_CLOEXEC);
        if (connection < 0) {
            return;
        }
        while (read(connection, buffer.data(), buffer.size()) > 0) {
        }
        close(connection);
    }
}

}  // namespace bench
