// Ownership of a file descriptor.
#ifndef PLATFORM_LINUX_COMMON_DESCRIPTOR_H
#define PLATFORM_LINUX_COMMON_DESCRIPTOR_H

#include "common/cancellation.h"

#include <fcntl.h>
#include <unistd.h>

#include <utility>

namespace VORK::PLATFORM {

class Descriptor {
public:
    explicit Descriptor(int fd = -1) : fd_(fd) {}
    ~Descriptor() {
        if (fd_ >= 0) {
            const CancellationOff guard;
            close(fd_);
        }
    }

    Descriptor(Descriptor &&other) noexcept : fd_(std::exchange(other.fd_, -1)) {}
    Descriptor &operator=(Descriptor &&other) noexcept {
        std::swap(fd_, other.fd_);
        return *this;
    }

    explicit operator bool() const { return fd_ >= 0; }
    int Get() const { return fd_; }

private:
    int fd_;
};

/// Opens; a cancellation waits until the descriptor has its owner, or it could leave it open for ever.
inline Descriptor OpenAt(int directory, const char *path, int flags, mode_t mode = 0) {
    const CancellationOff guard;
    return Descriptor(openat(directory, path, flags, mode));
}

inline Descriptor Open(const char *path, int flags, mode_t mode = 0) {
    const CancellationOff guard;
    return Descriptor(open(path, flags, mode));
}

}  // namespace VORK::PLATFORM

#endif
