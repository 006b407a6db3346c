/// \file
/// The owner of a file descriptor, which it closes at the end of its scope.
#pragma once

#include "base/cancellation.h"

#include <fcntl.h>
#include <unistd.h>

#include <utility>

namespace VORK {

class UniqueFd {
public:
    UniqueFd() = default;
    explicit UniqueFd(int fd) : fd_(fd) {}
    UniqueFd(UniqueFd &&other) noexcept : fd_(other.Release()) {}
    UniqueFd &operator=(UniqueFd &&other) noexcept {
        if (this != &other) {
            Close();
            fd_ = other.Release();
        }
        return *this;
    }
    ~UniqueFd() { Close(); }

    explicit operator bool() const { return fd_ >= 0; }
    int Get() const { return fd_; }
    int Release() { return std::exchange(fd_, -1); }

    /// False when the kernel reports at last that written data is lost. Keeps `errno` on success.
    bool Close() {
        if (fd_ < 0) {
            return true;
        }
        const NoCancellation closing;
        return close(Release()) == 0;
    }

private:
    int fd_ = -1;
};

/// Opens; a cancellation waits until the descriptor has its owner. It could land between the kernel's answer and
/// ours, and leave the descriptor open for ever.
inline UniqueFd Open(const char *path, int flags, mode_t mode = 0) {
    const NoCancellation opening;
    return UniqueFd(open(path, flags, mode));
}

inline UniqueFd OpenAt(int directory, const char *path, int flags, mode_t mode = 0) {
    const NoCancellation opening;
    return UniqueFd(openat(directory, path, flags, mode));
}

}  // namespace VORK
