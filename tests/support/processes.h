/// \file
/// Partners in other processes, and what a process leaves open.
#pragma once

#include <sys/types.h>

#include <functional>
#include <set>
#include <string>

namespace fileindex_test {

/// The open descriptors of this process, with what they lead to.
std::set<std::string> OpenDescriptors();

/// Runs the body in a child process and returns its exit status (128 + signal when killed).
int RunInChild(const std::function<int()> &body);

/// A process that holds a flock on a file until it is released or killed.
class LockAgent {
public:
    explicit LockAgent(const std::string &path, bool exclusive = true);
    ~LockAgent();
    LockAgent(const LockAgent &) = delete;
    LockAgent &operator=(const LockAgent &) = delete;

    void Release();
    /// Dies holding the lock.
    void Kill();

private:
    void Reap();

    pid_t child_ = -1;
    int leash_ = -1;  ///< the child lets go when this end is closed
};

/// A small file system in place of a directory's, gone at the end of the scope.
class MountedTmpfs {
public:
    MountedTmpfs(const std::string &directory, const std::string &options);
    ~MountedTmpfs();
    MountedTmpfs(const MountedTmpfs &) = delete;
    MountedTmpfs &operator=(const MountedTmpfs &) = delete;

private:
    std::string directory_;
};

}  // namespace fileindex_test
