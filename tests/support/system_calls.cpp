// The C functions that the library reaches for, each counted and ready to fail as a test says (script.h).
// What is not to fail goes on to the C library.
#undef _FORTIFY_SOURCE  // its inline open, openat and realpath would clash with the definitions below

#include "fake_daemon.h"
#include "script.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdarg>
#include <cstdlib>
#include <ctime>
#include <fstream>
#include <new>
#include <string>

using fileindex_test::FileChange;
using fileindex_test::NotCancelled;
using fileindex_test::Script;

namespace {

template <typename Result, typename... Arguments>
Result CallNext(const char *name, Arguments... arguments) {
    using Function = Result (*)(Arguments...);
    return reinterpret_cast<Function>(::dlsym(RTLD_NEXT, name))(arguments...);
}

std::string PathOf(int fd) {
    std::array<char, 4096> target{};
    const std::string link = "/proc/self/fd/" + std::to_string(fd);
    const ssize_t length = ::readlink(link.c_str(), target.data(), target.size());
    return length < 0 ? "" : std::string(target.data(), static_cast<size_t>(length));
}

std::string Below(int directory, const char *name) {
    return PathOf(directory) + "/" + name;
}

/// Counts the call and fails it if the test says so; else the C library's function is called.
template <typename Result, typename... Arguments>
Result Call(const char *name, const std::string &about, Arguments... arguments) {
    if (const auto fault = Script::Current().Take(name, about)) {
        errno = fault->error;
        return static_cast<Result>(fault->result);
    }
    return CallNext<Result>(name, arguments...);
}

/// What is appended to a queue is a line of the journal.
void RecordWrite(const std::string &path, const void *data, ssize_t size) {
    if (size > 0 && path.ends_with("/VORK@file_index_queue")) {
        std::string line(static_cast<const char *>(data), static_cast<size_t>(size));
        line.resize(line.find_last_not_of('\n') + 1);
        Script::Current().Record("event " + line);
    }
}

void RecordChange(const std::string &path, FileChange change) {
    if (!path.empty() && path == Script::Current().watched) {
        Script::Current().changes.push_back(std::move(change));
    }
}

void RecordLock(const std::string &path, int operation) {
    const std::string prefix = "/tmp/fileidx_cfg_";
    if (!path.starts_with(prefix)) {
        return;
    }
    const std::string name = path.substr(prefix.size(), path.rfind('.') - prefix.size());
    if ((operation & LOCK_UN) != 0) {
        Script::Current().locks.erase(name);
    } else {
        Script::Current().locks.insert((operation & LOCK_EX) != 0 ? name : name + " shared");
    }
}

/// `position`: the offset, for pwrite.
template <typename... Position>
ssize_t Write(const char *name, int fd, const void *data, size_t size, Position... position) {
    const std::string path = PathOf(fd);
    if (const auto fault = Script::Current().Take("write", path + " " + std::to_string(size))) {
        if (fault->result <= 0) {
            errno = fault->error;
            return fault->result;
        }
        size = std::min(size, static_cast<size_t>(fault->result));  // a short write is a real one
    }
    const off_t offset = (::lseek(fd, 0, SEEK_CUR), ..., position);
    const auto written = CallNext<ssize_t>(name, fd, data, size, position...);
    const int error = errno;
    RecordWrite(path, data, written);
    if (written > 0) {
        RecordChange(path, {FileChange::Kind::kWrite, static_cast<size_t>(offset),
                            std::string(static_cast<const char *>(data), static_cast<size_t>(written))});
    }
    errno = error;
    return written;
}

int Flush(const char *name, int fd) {
    const std::string path = PathOf(fd);
    const int result = Call<int>(name, path, fd);
    if (result == 0) {
        RecordChange(path, {FileChange::Kind::kFlush});
    }
    return result;
}

mode_t ModeIn(int flags, va_list arguments) {
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the callers have started it
    return (flags & (O_CREAT | O_TMPFILE)) != 0 ? va_arg(arguments, mode_t) : 0;
}

}  // namespace

extern "C" {

// The name has to be the C library's, which no function can give: one row for each that is only counted, with what
// it is about and its arguments.
#define COUNTED(result, name, parameters, about, ...)   \
    result name parameters {                            \
        return Call<result>(#name, about, __VA_ARGS__); \
    }
COUNTED(ssize_t, pread, (int fd, void *to, size_t size, off_t at), PathOf(fd), fd, to, size, at)
COUNTED(int, lstat, (const char *path, struct stat *out) noexcept, path, path, out)
COUNTED(int, fchmod, (int fd, mode_t mode) noexcept, PathOf(fd), fd, mode)
COUNTED(int, linkat, (int a, const char *from, int b, const char *to, int flags) noexcept, to, a, from, b, to,
        flags)
COUNTED(int, mkdirat, (int at, const char *name, mode_t mode) noexcept, Below(at, name), at, name, mode)
COUNTED(int, fstatat, (int at, const char *name, struct stat *out, int flags) noexcept, Below(at, name), at, name,
        out, flags)
COUNTED(int, socket, (int domain, int type, int protocol) noexcept, "", domain, type, protocol)
COUNTED(int, setsockopt, (int fd, int level, int option, const void *value, socklen_t size) noexcept,
        std::to_string(option) + " " + std::to_string(*static_cast<const long *>(value)), fd, level, option, value,
        size)
COUNTED(int, usleep, (useconds_t time), std::to_string(time), time)
#undef COUNTED

int open(const char *path, int flags, ...) {
    va_list arguments;
    va_start(arguments, flags);
    const mode_t mode = ModeIn(flags, arguments);
    va_end(arguments);
    return Call<int>("open", path, path, flags, mode);
}

int openat(int directory, const char *name, int flags, ...) {
    va_list arguments;
    va_start(arguments, flags);
    const mode_t mode = ModeIn(flags, arguments);
    va_end(arguments);
    if (directory == AT_FDCWD) {  // not the library's: the C++ library removes directories with it
        return CallNext<int>("openat", directory, name, flags, mode);
    }
    return Call<int>("openat", Below(directory, name), directory, name, flags, mode);
}

/// A close that fails has closed all the same.
int close(int fd) {
    const std::string path = PathOf(fd);
    const auto fault = Script::Current().Take("close", path);
    RecordLock(path, LOCK_UN);
    const int result = CallNext<int>("close", fd);
    fileindex_test::FakeDaemon::Closed(fd);
    if (fault) {
        errno = fault->error;
        return -1;
    }
    return result;
}

ssize_t write(int fd, const void *data, size_t size) {
    return Write("write", fd, data, size);
}

ssize_t pwrite(int fd, const void *data, size_t size, off_t offset) {
    return Write("pwrite", fd, data, size, offset);
}

int flock(int fd, int operation) noexcept {
    const std::string path = PathOf(fd);
    const int result = Call<int>("flock", path, fd, operation);
    const int error = errno;
    if (result == 0) {
        RecordLock(path, operation);
    }
    errno = error;
    return result;
}

/// A save ends so.
int chmod(const char *path, mode_t mode) noexcept {
    const int result = Call<int>("chmod", path, path, mode);
    const std::string name(path);
    if (result == 0 && name.ends_with(".conf")) {
        const NotCancelled reading;
        std::ifstream file(name, std::ios::binary);
        std::string text;
        std::getline(file, text);
        Script::Current().Record("saved " + name.substr(name.rfind('/') + 1) + " " + text);
    }
    return result;
}

int ftruncate(int fd, off_t length) noexcept {
    const int result = Call<int>("ftruncate", PathOf(fd), fd, length);
    if (result == 0) {
        RecordChange(PathOf(fd), {FileChange::Kind::kLength, static_cast<size_t>(length)});
    }
    return result;
}

int fsync(int fd) {
    return Flush("fsync", fd);
}

int fdatasync(int fd) {
    return Flush("fdatasync", fd);
}

int connect(int fd, const struct sockaddr *address, socklen_t length) {
    if (const auto fault = Script::Current().Take("connect", std::to_string(length))) {
        errno = fault->error;
        return -1;
    }
    const NotCancelled connecting;
    return fileindex_test::FakeDaemon::Connect(fd, address);
}

int rand(void) noexcept {
    return Script::Current().random ? *Script::Current().random : CallNext<int>("rand");
}

time_t time(time_t *out) noexcept {
    const time_t now = Script::Current().now ? *Script::Current().now : CallNext<time_t>("time", nullptr);
    if (out != nullptr) {
        *out = now;
    }
    return now;
}

int clock_gettime(clockid_t clock, struct timespec *now) noexcept {
    const long result = ::syscall(SYS_clock_gettime, clock, now);
    now->tv_sec += Script::Current().secondsPassed;
    return static_cast<int>(result);
}

}  // extern "C"

/// The one allocation of the library that may fail without an exception.
void *operator new(size_t size, const std::nothrow_t & /*unused*/) noexcept {
    return Script::Current().Take("new") ? nullptr : ::operator new(size);
}
