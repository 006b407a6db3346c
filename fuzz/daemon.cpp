// The socket's other end: a daemon that takes every command. The platform is that of the unit tests.

#include "json/text.h"
#include "scoped.h"
#include "support.h"

#include <fcntl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace {

using fileindex_fuzz::Require;
using VORK::FILEINDEX::internal::JsonReader;
using VORK::FILEINDEX::internal::UniqueFd;

/// The daemon's end of the last connection, and what came over the earlier ones.
struct Daemon {
    UniqueFd connection;
    std::vector<Json::Value> commands;

    void Receive() {
        std::string frame;
        char block[4096];
        ssize_t count = 0;
        while (connection && (count = recv(connection.Get(), block, sizeof(block), MSG_DONTWAIT)) > 0) {
            frame.append(block, static_cast<std::size_t>(count));
        }
        connection.Close();
        if (frame.empty()) {
            return;
        }
        std::uint32_t length = 0;
        Require(frame.size() > sizeof(length), "the frame is cut", frame);
        std::memcpy(&length, frame.data(), sizeof(length));
        Require(length == frame.size() - sizeof(length) && frame.back() == '\0', "the frame's length is wrong");
        Json::Value command;
        const std::string_view text(frame.data() + sizeof(length), length - 1);
        Require(JsonReader().Parse(text, command), "the command is no JSON", text);
        commands.push_back(command);
    }
};

Daemon &TheDaemon() {
    static Daemon daemon;
    return daemon;
}

}  // namespace

namespace fileindex_fuzz {

std::vector<Json::Value> TakeCommands() {
    TheDaemon().Receive();
    return std::exchange(TheDaemon().commands, {});
}

}  // namespace fileindex_fuzz

extern "C" int connect(int fd, const sockaddr *, socklen_t) {
    TheDaemon().Receive();
    int ends[2] = {};
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends) != 0) {
        return -1;
    }
    const UniqueFd near(ends[0]);
    const UniqueFd far(ends[1]);
    constexpr int kOutOfTheWay = 500;  // the lowest free descriptor is what the leak check looks at
    TheDaemon().connection = UniqueFd(fcntl(far.Get(), F_DUPFD_CLOEXEC, kOutOfTheWay));
    return dup3(near.Get(), fd, O_CLOEXEC) == fd ? 0 : -1;
}
