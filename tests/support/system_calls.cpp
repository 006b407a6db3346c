// The C functions that the library reaches for, each counted and ready to fail as a test says (script.h).
// What is not to fail goes on to the C library.
#undef _FORTIFY_SOURCE  // its inline open and realpath would clash with the definitions below

#include "script.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdarg>
#include <cstdlib>
#include <ctime>
#include <mutex>
#include <set>
#include <string>

using fileindex_test::Fault;
using fileindex_test::Script;

namespace {

template <typename Function>
Function *Next(const char *name) {
    return reinterpret_cast<Function *>(::dlsym(RTLD_NEXT, name));
}

std::string PathOf(int fd) {
    std::array<char, 4096> target{};
    const std::string link = "/proc/self/fd/" + std::to_string(fd);
    const ssize_t length = ::readlink(link.c_str(), target.data(), target.size());
    return length < 0 ? "" : std::string(target.data(), static_cast<size_t>(length));
}

template <typename Result>
Result Fail(const Fault &fault) {
    errno = fault.error;
    return static_cast<Result>(fault.result);
}

/// What is appended to a queue is a line of the journal.
void RecordWrite(const std::string &path, const void *data, ssize_t size) {
    if (size <= 0) {
        return;
    }
    if (path.ends_with("/VORK@file_index_queue")) {
        std::string line(static_cast<const char *>(data), static_cast<size_t>(size));
        line.resize(line.find_last_not_of('\n') + 1);
        Script::Current().Record("event " + line);
    }
}

void RecordLock(const std::string &path, int operation) {
    const std::string prefix = "/tmp/fileidx_cfg_";
    if (!path.starts_with(prefix)) {
        return;
    }
    const std::string name = path.substr(prefix.size(), path.rfind('.') - prefix.size());
    const bool exclusive = (operation & LOCK_EX) != 0;
    Script::Current().Record((operation & LOCK_UN) != 0 ? "unlock " + name
                                                        : "lock " + name + (exclusive ? " exclusive" : " shared"));
}

class Connections {
public:
    void Add(int fd) {
        const std::lock_guard guard(mutex_);
        descriptors_.insert(fd);
    }
    bool Remove(int fd) {
        const std::lock_guard guard(mutex_);
        return descriptors_.erase(fd) != 0;
    }

private:
    std::mutex mutex_;
    std::set<int> descriptors_;
};

Connections &OpenConnections() {
    static Connections connections;
    return connections;
}

template <typename Write>
ssize_t WriteOr(int fd, const void *data, size_t size, Write real) {
    const std::string path = PathOf(fd);
    if (const auto fault = Script::Current().Take("write", path + " " + std::to_string(size))) {
        if (fault->result <= 0) {
            return Fail<ssize_t>(*fault);
        }
        size = std::min(size, static_cast<size_t>(fault->result));  // a short write is a real one
    }
    const ssize_t written = real(data, size);
    const int error = errno;
    RecordWrite(path, data, written);
    errno = error;
    return written;
}

}  // namespace

extern "C" {

int open(const char *path, int flags, ...) {
    mode_t mode = 0;
    if ((flags & (O_CREAT | O_TMPFILE)) != 0) {
        va_list arguments;
        va_start(arguments, flags);
        mode = va_arg(arguments, mode_t);
        va_end(arguments);
    }
    if (const auto fault = Script::Current().Take("open", path)) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(const char *, int, ...)>("open");
    return real(path, flags, mode);
}

int close(int fd) {
    const bool connection = OpenConnections().Remove(fd);
    static auto *const real = Next<int(int)>("close");
    const int result = real(fd);
    if (connection) {
        Script::Current().HungUp();
    }
    return result;
}

ssize_t write(int fd, const void *data, size_t size) {
    static auto *const real = Next<ssize_t(int, const void *, size_t)>("write");
    return WriteOr(fd, data, size, [fd](const void *from, size_t count) { return real(fd, from, count); });
}

ssize_t pwrite(int fd, const void *data, size_t size, off_t offset) {
    static auto *const real = Next<ssize_t(int, const void *, size_t, off_t)>("pwrite");
    return WriteOr(fd, data, size,
                   [fd, offset](const void *from, size_t count) { return real(fd, from, count, offset); });
}

int flock(int fd, int operation) noexcept {
    const std::string path = PathOf(fd);
    if (const auto fault = Script::Current().Take("flock", path)) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(int, int)>("flock");
    const int result = real(fd, operation);
    const int error = errno;
    if (result == 0) {
        RecordLock(path, operation);
    }
    errno = error;
    return result;
}

int lstat(const char *path, struct stat *buffer) noexcept {
    if (const auto fault = Script::Current().Take("lstat", path)) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(const char *, struct stat *)>("lstat");
    return real(path, buffer);
}

int chmod(const char *path, mode_t mode) noexcept {
    if (const auto fault = Script::Current().Take("chmod", path)) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(const char *, mode_t)>("chmod");
    const int result = real(path, mode);
    const std::string_view name(path);
    if (result == 0 && name.ends_with(".conf")) {
        Script::Current().Record("saved " + std::string(name.substr(name.rfind('/') + 1)));  // a save ends so
    }
    return result;
}

int mkdir(const char *path, mode_t mode) noexcept {
    if (const auto fault = Script::Current().Take("mkdir", path)) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(const char *, mode_t)>("mkdir");
    return real(path, mode);
}

int ftruncate(int fd, off_t length) noexcept {
    if (const auto fault = Script::Current().Take("ftruncate", PathOf(fd))) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(int, off_t)>("ftruncate");
    return real(fd, length);
}

int fallocate(int fd, int mode, off_t offset, off_t length) {
    if (const auto fault = Script::Current().Take("fallocate", PathOf(fd))) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(int, int, off_t, off_t)>("fallocate");
    return real(fd, mode, offset, length);
}

int socket(int domain, int type, int protocol) noexcept {
    if (const auto fault = Script::Current().Take("socket")) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(int, int, int)>("socket");
    return real(domain, type, protocol);
}

int connect(int fd, const struct sockaddr *address, socklen_t length) {
    if (const auto fault = Script::Current().Take("connect", std::to_string(length))) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(int, const struct sockaddr *, socklen_t)>("connect");
    const int result = real(fd, address, length);
    if (result == 0) {
        OpenConnections().Add(fd);
    }
    return result;
}

int setsockopt(int fd, int level, int option, const void *value, socklen_t length) noexcept {
    if (const auto fault = Script::Current().Take("setsockopt", std::to_string(option))) {
        return Fail<int>(*fault);
    }
    static auto *const real = Next<int(int, int, int, const void *, socklen_t)>("setsockopt");
    return real(fd, level, option, value, length);
}

int usleep(useconds_t microseconds) {
    Script::Current().Take("usleep", std::to_string(microseconds));
    static auto *const real = Next<int(useconds_t)>("usleep");
    return real(microseconds);
}

int rand(void) noexcept {
    static auto *const real = Next<int()>("rand");
    return Script::Current().random.value_or(real());
}

time_t time(time_t *out) noexcept {
    static auto *const real = Next<time_t(time_t *)>("time");
    const time_t now = Script::Current().now.value_or(real(nullptr));
    if (out != nullptr) {
        *out = now;
    }
    return now;
}

}  // extern "C"
