/// \file
/// A partner who holds a lock, and what a process leaves open.
#pragma once

#include <fcntl.h>
#include <sys/file.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <set>
#include <string>
#include <system_error>

namespace fileindex_test {

/// The open descriptors of this process, with what they lead to.
inline std::set<std::string> OpenDescriptors() {
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

/// Somebody else who holds a flock on a file. By system calls: the replaced functions are not his.
class LockAgent {
public:
    explicit LockAgent(const std::string &path)
        : fd_(::syscall(SYS_openat, AT_FDCWD, path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644)) {
        if (::syscall(SYS_flock, fd_, LOCK_EX | LOCK_NB) != 0) {
            std::perror("lock agent");
            std::abort();
        }
    }
    ~LockAgent() { Release(); }
    LockAgent(const LockAgent &) = delete;
    LockAgent &operator=(const LockAgent &) = delete;

    void Release() {
        ::syscall(SYS_close, fd_);
        fd_ = -1;
    }

private:
    long fd_;
};

}  // namespace fileindex_test
