// Ownership of a file descriptor.
#ifndef PLATFORM_LINUX_COMMON_DESCRIPTOR_H
#define PLATFORM_LINUX_COMMON_DESCRIPTOR_H

#include <unistd.h>

#include <utility>

namespace VORK::PLATFORM {

class Descriptor {
public:
    explicit Descriptor(int fd = -1) : fd_(fd) {}
    ~Descriptor() {
        if (fd_ >= 0) {
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

}  // namespace VORK::PLATFORM

#endif
