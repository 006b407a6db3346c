#include "processes.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/mount.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <system_error>

namespace fileindex_test {
namespace {

void Require(bool fine, const char *what) {
    if (!fine) {
        std::perror(what);
        std::abort();
    }
}

int WaitFor(pid_t child) {
    int status = 0;
    Require(::waitpid(child, &status, 0) == child, "waitpid");
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

}  // namespace

std::set<std::string> OpenDescriptors() {
    std::set<std::string> open;
    for (const auto &entry : std::filesystem::directory_iterator("/proc/self/fd")) {
        std::error_code gone;  // the iterator's own descriptor is in its list
        const std::string target = std::filesystem::read_symlink(entry.path(), gone).string();
        if (!target.starts_with("/proc/")) {
            open.insert(entry.path().filename().string() + " " + target);
        }
    }
    return open;
}

int RunInChild(const std::function<int()> &body) {
    const pid_t child = ::fork();
    Require(child >= 0, "fork");
    if (child == 0) {
        ::_exit(body());
    }
    return WaitFor(child);
}

LockAgent::LockAgent(const std::string &path, bool exclusive) {
    std::array<int, 2> leash{};
    std::array<int, 2> ready{};
    Require(::pipe2(leash.data(), O_CLOEXEC) == 0 && ::pipe2(ready.data(), O_CLOEXEC) == 0, "pipe2");
    child_ = ::fork();
    Require(child_ >= 0, "fork");
    if (child_ == 0) {
        // System calls only: the parent may have threads, and its replaced functions are not ours to use.
        ::syscall(SYS_close, leash[1]);
        const long fd = ::syscall(SYS_openat, AT_FDCWD, path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644);
        char byte = ::syscall(SYS_flock, fd, exclusive ? LOCK_EX : LOCK_SH) == 0 ? 'y' : 'n';
        ::syscall(SYS_write, ready[1], &byte, 1);
        while (::syscall(SYS_read, leash[0], &byte, 1) > 0) {
        }
        ::_exit(0);
    }
    ::close(leash[0]);
    ::close(ready[1]);
    leash_ = leash[1];
    char byte = 'n';
    Require(::read(ready[0], &byte, 1) == 1 && byte == 'y', "lock agent");
    ::close(ready[0]);
}

LockAgent::~LockAgent() {
    Release();
}

void LockAgent::Release() {
    if (leash_ >= 0) {
        ::close(leash_);
        leash_ = -1;
        Reap();
    }
}

void LockAgent::Kill() {
    ::kill(child_, SIGKILL);
    Release();
}

void LockAgent::Reap() {
    WaitFor(child_);
}

MountedTmpfs::MountedTmpfs(const std::string &directory, const std::string &options) : directory_(directory) {
    Require(::mount("tmpfs", directory.c_str(), "tmpfs", 0, options.c_str()) == 0, "mount");
}

MountedTmpfs::~MountedTmpfs() {
    ::umount2(directory_.c_str(), MNT_DETACH);
}

}  // namespace fileindex_test
