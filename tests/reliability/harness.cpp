#include "harness.h"

#include <json/reader.h>

#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>

#include <chrono>
#include <csignal>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>

namespace reliability {

namespace fs = std::filesystem;

int Rounds(int quick, int whole) {
    const char *tier = std::getenv("FILEINDEX_TORTURE");
    return tier != nullptr && std::string(tier) == "long" ? whole : quick;
}

void Check(bool fine, const std::string &reason) {
    if (!fine) {
        std::fprintf(stderr, "FAILED: %s (errno %s)\n", reason.c_str(), std::strerror(errno));
        ::_exit(1);
    }
}

void SkipUnderSanitizers(const std::string &reason) {
    const char *sanitizers = std::getenv("SANITIZE");
    if (sanitizers != nullptr && *sanitizers != '\0') {
        std::printf("skipped: %s\n", reason.c_str());
        std::exit(77);
    }
}

void Figure(const char *format, ...) {
    std::va_list values;
    va_start(values, format);
    std::printf("figure: ");
    std::vprintf(format, values);
    va_end(values);
    std::puts("");
    std::fflush(stdout);
}

double Now() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

std::optional<std::string> ReadFile(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return file ? std::optional(std::string(std::istreambuf_iterator<char>(file), {})) : std::nullopt;
}

void WriteFile(const std::string &path, const std::string &text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text;
    Check(static_cast<bool>(file.flush()), "write " + path);
}

std::optional<Json::Value> Parse(const std::string &text) {
    Json::CharReaderBuilder builder;
    builder["failIfExtra"] = true;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value value;
    const bool parsed = reader->parse(text.data(), text.data() + text.size(), &value, nullptr);
    return parsed ? std::optional(value) : std::nullopt;
}

pid_t Start(const std::function<void()> &body) {
    const pid_t parent = ::getpid();
    const pid_t child = ::fork();
    Check(child >= 0, "fork");
    if (child == 0) {
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        if (::getppid() == parent) {
            body();
        }
        ::_exit(0);
    }
    return child;
}

int Wait(pid_t child) {
    int status = 0;
    Check(::waitpid(child, &status, 0) == child, "waitpid");
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

void Kill(pid_t child) {
    ::kill(child, SIGKILL);
    Check(Wait(child) == 128 + SIGKILL, "a process ended before it was killed");
}

std::function<ssize_t(int, const void *, size_t)> &WriteHook() {
    static std::function<ssize_t(int, const void *, size_t)> hook;
    return hook;
}

ssize_t RealWrite(int fd, const void *data, size_t size) {
    return ::syscall(SYS_write, fd, data, size);
}

std::function<double()> &ClockHook() {
    static std::function<double()> hook;
    return hook;
}

void MakeMachine(bool search) {
    // The fixed places may only be emptied where they are this program's own.
    Check(ReadFile("/proc/self/mountinfo").value_or("").find("fileindex-private") != std::string::npos,
          "not in a private namespace");
    for (const char *path : {kFolderConf, kStatusConf, kFolderLock, kStatusLock, kSocket, "/vol1/photo/@eaDir",
                             "/vol1/music/@eaDir", "/usr/vork/etc/vorknotifyd"}) {
        fs::remove_all(path);
    }
    fs::create_directories("/vol1/photo/@eaDir");
    fs::create_directories("/vol1/music/@eaDir");
    const std::string conf = "/usr/vork/etc/platform.conf";
    const std::string platform = std::string(R"({"shares": {"music": {"path": "/vol1/music"}, )") +
                                 R"("photo": {"path": "/vol1/photo"}}, "search": )" + (search ? "true" : "false") +
                                 "}\n";
    if (Parse(ReadFile(conf).value_or("")) != Parse(platform)) {
        WriteFile(conf, platform);
    }
    // The platform reads its file more often while the file is fresh; a trace is to be the same each time.
    while (fs::file_time_type::clock::now() - fs::last_write_time(conf) < std::chrono::milliseconds(50)) {
        ::usleep(1000);
    }
    for (const char *program : {"/etc/init.d/fileindexd", "/etc/init.d/smbd", "/usr/vork/bin/vorkzolnotify"}) {
        WriteFile(program, "#!/bin/sh\n");
        fs::permissions(program, fs::perms(0755));
    }
}

sockaddr_un SocketAddress() {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kSocket, sizeof kSocket);
    return address;
}

int Listen(int backlog) {
    ::unlink(kSocket);
    const int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const sockaddr_un address = SocketAddress();
    Check(::bind(listener, reinterpret_cast<const sockaddr *>(&address), sizeof address) == 0, "bind");
    Check(backlog < 0 || ::listen(listener, backlog) == 0, "listen");
    return listener;
}

pid_t StartDaemon() {
    const int listener = Listen(64);
    const pid_t daemon = Start([listener] {
        for (int fd = -1; (fd = ::accept(listener, nullptr, nullptr)) >= 0; ::close(fd)) {
            std::array<char, 4096> buffer{};
            while (::read(fd, buffer.data(), buffer.size()) > 0) {
            }
        }
    });
    ::close(listener);
    return daemon;
}

Json::Value FolderRequest(const std::string &path, const std::string &name) {
    Json::Value folder(Json::objectValue);
    folder["path"] = path;
    folder["name"] = name;
    folder["photo"] = true;
    return folder;
}

}  // namespace reliability

extern "C" int clock_gettime(clockid_t clock, timespec *now) noexcept {
    const auto &hook = reliability::ClockHook();
    if (clock != CLOCK_MONOTONIC || !hook) {
        return static_cast<int>(::syscall(SYS_clock_gettime, clock, now));
    }
    const double seconds = hook();
    *now = {static_cast<time_t>(seconds), static_cast<long>(seconds * 1e9) % 1000000000};
    return 0;
}

extern "C" ssize_t write(int fd, const void *data, size_t size) {
    const auto &hook = reliability::WriteHook();
    return hook ? hook(fd, data, size) : reliability::RealWrite(fd, data, size);
}
