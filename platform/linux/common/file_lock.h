/// \file
/// A lock file: what it stands for is changed by one process at a time.
#pragma once

#include "base/unique_fd.h"

#include <optional>
#include <string>
#include <utility>

namespace VORK::PLATFORM {

/// A lock that was taken. It is given up by name at the end: a child that the host forked meanwhile may have a
/// copy of the descriptor, and closing ours alone would leave the lock with the child.
class FileLock {
public:
    explicit FileLock(UniqueFd file) : file_(std::move(file)) {}
    FileLock(FileLock &&) noexcept = default;
    FileLock &operator=(FileLock &&) = delete;
    ~FileLock();

private:
    UniqueFd file_;
};

/// Takes the exclusive lock on the lock file, making the file when needed. Waits two seconds at most: the
/// callers' own callers hold locks. Nothing, with errno set (ETIMEDOUT when others kept it), on failure.
std::optional<FileLock> TakeLock(const std::string &lockPath);

}  // namespace VORK::PLATFORM
