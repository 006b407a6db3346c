/// \file
/// A partner who holds a lock, and what a process leaves open.
#pragma once

#include <set>
#include <string>

namespace fileindex_test {

/// The open descriptors of this process, with what they lead to.
std::set<std::string> OpenDescriptors();

/// Somebody else who holds a flock on a file.
class LockAgent {
public:
    explicit LockAgent(const std::string &path);
    ~LockAgent() { Release(); }
    LockAgent(const LockAgent &) = delete;
    LockAgent &operator=(const LockAgent &) = delete;

    void Release();

private:
    long fd_;
};

}  // namespace fileindex_test
