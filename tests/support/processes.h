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

/// Somebody else who holds a flock on a file.
class LockAgent {
public:
    explicit LockAgent(const std::string &path);
    ~LockAgent();
    LockAgent(const LockAgent &) = delete;
    LockAgent &operator=(const LockAgent &) = delete;

    void Release();

private:
    long fd_;
};

}  // namespace fileindex_test
