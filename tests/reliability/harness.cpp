#include "harness.h"

#include "support/processes.h"

#include <json/reader.h>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/un.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <sstream>

namespace reliability {

namespace {

constexpr char kPlatformConf[] = "/usr/vork/etc/platform.conf";

/// The platform reads its file more often while the file is fresh; a trace is to be the same each time.
void AwaitAge(const std::string &path) {
    struct stat status {};
    Check(::stat(path.c_str(), &status) == 0, path);
    timespec now{};
    while (::clock_gettime(CLOCK_REALTIME, &now) == 0 &&
           (now.tv_sec - status.st_ctim.tv_sec) * 1000 + (now.tv_nsec - status.st_ctim.tv_nsec) / 1000000 < 50) {
        ::usleep(1000);
    }
}

}  // namespace

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

void Figure(const std::string &subject, const std::string &measured) {
    std::printf("figure: %s | %s\n", subject.c_str(), measured.c_str());
    std::fflush(stdout);
}

std::optional<std::string> ReadFile(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        return std::nullopt;
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
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
    if (!reader->parse(text.data(), text.data() + text.size(), &value, nullptr)) {
        return std::nullopt;
    }
    return value;
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

SameDescriptors::SameDescriptors() : before_(fileindex_test::OpenDescriptors()) {}

SameDescriptors::~SameDescriptors() {
    Check(fileindex_test::OpenDescriptors() == before_, "descriptors differ before and after");
}

void *SharedMemory(size_t size) {
    void *memory = ::mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    Check(memory != MAP_FAILED, "mmap");
    return memory;
}

std::function<ssize_t(int, const void *, size_t)> &WriteHook() {
    static std::function<ssize_t(int, const void *, size_t)> hook;
    return hook;
}

ssize_t RealWrite(int fd, const void *data, size_t size) {
    return ::syscall(SYS_write, fd, data, size);
}

void MakeMachine(bool search) {
    namespace fs = std::filesystem;
    // The fixed places may only be emptied where they are this program's own.
    Check(ReadFile("/proc/self/mountinfo").value_or("").find("fileindex-private") != std::string::npos,
          "not in a private namespace");
    for (const char *path : {kFolderConf, kStatusConf, kFolderLock, kStatusLock, kSocket, "/vol1/photo/@eaDir",
                             "/vol1/music/@eaDir", "/usr/vork/etc/vorknotifyd"}) {
        fs::remove_all(path);
    }
    fs::create_directories("/vol1/photo/@eaDir");
    fs::create_directories("/vol1/music/@eaDir");
    const std::string platform = std::string(R"({"shares": {"music": {"path": "/vol1/music"}, )") +
                                 R"("photo": {"path": "/vol1/photo"}}, "search": )" + (search ? "true" : "false") +
                                 "}\n";
    if (Parse(ReadFile(kPlatformConf).value_or("")) != Parse(platform)) {
        WriteFile(kPlatformConf, platform);
    }
    AwaitAge(kPlatformConf);
    for (const char *program : {"/etc/init.d/fileindexd", "/etc/init.d/smbd", "/usr/vork/bin/vorkzolnotify"}) {
        WriteFile(program, "#!/bin/sh\n");
        Check(::chmod(program, 0755) == 0, program);
    }
}

int Listen(int backlog) {
    ::unlink(kSocket);
    const int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::memcpy(address.sun_path, kSocket, sizeof kSocket);
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

Json::Value Array(std::initializer_list<Json::Value> elements) {
    Json::Value array(Json::arrayValue);
    for (const Json::Value &element : elements) {
        array.append(element);
    }
    return array;
}

}  // namespace reliability

extern "C" ssize_t write(int fd, const void *data, size_t size) {
    const auto &hook = reliability::WriteHook();
    return hook ? hook(fd, data, size) : reliability::RealWrite(fd, data, size);
}
