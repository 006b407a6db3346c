#include "fake_daemon.h"

#include "script.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <cstring>

namespace fileindex_test {
namespace {

constexpr char kSocket[] = "/var/run/fileindexd.sock";

std::string ReadToEnd(int fd) {
    std::string all;
    std::array<char, 4096> buffer{};
    for (ssize_t got = 0; (got = ::recv(fd, buffer.data(), buffer.size(), 0)) > 0;) {
        all.append(buffer.data(), static_cast<size_t>(got));
    }
    return all;
}

std::string Decode(const std::string &frame) {
    std::uint32_t length = 0;
    if (frame.size() < sizeof length) {
        return "malformed: " + frame;
    }
    std::memcpy(&length, frame.data(), sizeof length);
    if (length == 0 || frame.size() != sizeof length + length ||
        frame.find('\0', sizeof length) != frame.size() - 1) {
        return "malformed: " + frame;
    }
    return frame.substr(sizeof length, length - 1);
}

}  // namespace

FakeDaemon::~FakeDaemon() {
    Stop();
}

void FakeDaemon::Start(Mood mood) {
    ::unlink(kSocket);
    listener_ = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kSocket, sizeof kSocket);
    if (::bind(listener_, reinterpret_cast<const sockaddr *>(&address), sizeof address) != 0 ||
        ::listen(listener_, mood == Mood::kDeaf ? 0 : 64) != 0) {
        std::abort();
    }
    if (mood == Mood::kDeaf) {
        return;
    }
    thread_ = std::thread([this, mood] { Serve(mood); });
    if (mood == Mood::kCollecting) {
        Script::Current().OnHangUp([this] { AwaitAll(); });
    }
}

void FakeDaemon::Stop() {
    if (listener_ < 0) {
        return;
    }
    Script::Current().OnHangUp(nullptr);
    ::shutdown(listener_, SHUT_RDWR);  // ends the thread's accept
    if (thread_.joinable()) {
        thread_.join();
    }
    ::close(listener_);
    ::unlink(kSocket);
    listener_ = -1;
}

void FakeDaemon::Serve(Mood mood) {
    for (int fd = -1; (fd = ::accept4(listener_, nullptr, nullptr, SOCK_CLOEXEC)) >= 0;) {
        const std::string frame = mood == Mood::kCollecting ? ReadToEnd(fd) : "";
        ::close(fd);
        Script::Current().Record("command " + Decode(frame));
        const std::lock_guard guard(mutex_);
        frames_.push_back(frame);
        served_.notify_all();
    }
}

/// Keeps the caller waiting until what it has sent is in the journal, so that the journal's order is that of
/// the calls.
void FakeDaemon::AwaitAll() {
    std::unique_lock lock(mutex_);
    ++hung_up_;
    served_.wait_for(lock, std::chrono::seconds(30), [this] { return frames_.size() >= hung_up_; });
}

std::vector<std::string> FakeDaemon::Frames() {
    const std::lock_guard guard(mutex_);
    return frames_;
}

std::vector<std::string> FakeDaemon::Commands() {
    std::vector<std::string> commands;
    for (const std::string &frame : Frames()) {
        commands.push_back(Decode(frame));
    }
    return commands;
}

}  // namespace fileindex_test
