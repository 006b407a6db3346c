// Stands in for the indexing daemon: listens on its socket and writes down every command it receives.
//
//   fileindex_demo_peer RECORD PIDFILE
//
// Returns once the socket listens and goes on in the background, as an init script expects of a daemon. Each frame
// becomes one line of RECORD: the length it announced, and its JSON; or what is wrong with it.
#include <json/reader.h>
#include <json/value.h>

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <memory>
#include <optional>
#include <string>

namespace {

constexpr char kSocket[] = "/var/run/fileindexd.sock";
constexpr std::uint32_t kLongestFrame = 1U << 20U;

class Descriptor {
public:
    explicit Descriptor(int fd) : fd_(fd) {}
    ~Descriptor() {
        if (fd_ >= 0) {
            close(fd_);
        }
    }
    Descriptor(const Descriptor &) = delete;
    Descriptor &operator=(const Descriptor &) = delete;
    int Get() const { return fd_; }

private:
    int fd_;
};

bool ReadExactly(int fd, void *buffer, std::size_t size) {
    return recv(fd, buffer, size, MSG_WAITALL) == static_cast<ssize_t>(size);
}

// A frame is its length, four bytes in the machine's order, then as many bytes: JSON and a final NUL.
std::string DescribeFrame(int connection) {
    std::uint32_t length = 0;
    if (!ReadExactly(connection, &length, sizeof length)) {
        return "malformed: no length";
    }
    if (length == 0 || length > kLongestFrame) {
        return "malformed: length " + std::to_string(length);
    }
    std::string text(length, '\0');
    if (!ReadExactly(connection, text.data(), text.size())) {
        return "malformed: fewer than the announced " + std::to_string(length) + " bytes";
    }
    if (text.find('\0') != text.size() - 1) {
        return "malformed: no NUL at the end of the text, and there alone";
    }
    text.pop_back();

    Json::Value message;
    std::string errors;
    const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
    if (!reader->parse(text.data(), text.data() + text.size(), &message, &errors) || !message.isObject()) {
        return "malformed: not a JSON object: " + text;
    }
    return std::to_string(length) + " " + text;
}

int Listen() {
    const int fd = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kSocket, sizeof kSocket);
    unlink(kSocket);
    if (fd < 0 || bind(fd, reinterpret_cast<const sockaddr *>(&address), sizeof address) != 0 ||
        listen(fd, SOMAXCONN) != 0) {
        std::perror(kSocket);
        return -1;
    }
    return fd;
}

[[noreturn]] void Serve(int listener, std::ofstream &record) {
    while (true) {
        const Descriptor connection(accept4(listener, nullptr, nullptr, SOCK_CLOEXEC));
        if (connection.Get() >= 0) {
            record << DescribeFrame(connection.Get()) << std::endl;
        }
    }
}

}  // namespace

int main(int argc, char **argv) {
    if (argc != 3) {
        std::cerr << "usage: fileindex_demo_peer RECORD PIDFILE\n";
        return 2;
    }
    const Descriptor listener(Listen());
    std::ofstream record(argv[1], std::ios::app);
    if (listener.Get() < 0 || !record) {
        return 1;
    }
    if (daemon(0, 0) != 0) {
        std::perror("daemon");
        return 1;
    }
    std::ofstream(argv[2]) << getpid() << '\n';
    Serve(listener.Get(), record);
}
