/// \file
/// The library's calls that change a file or a socket, seen before the kernel gets them.
#pragma once

#include <sys/types.h>

#include <functional>

namespace reliability {

/// One that is empty lets the call through.
struct Hooks {
    std::function<ssize_t(int fd, const void *data, size_t size)> write;
    std::function<ssize_t(int fd, const void *data, size_t size, off_t offset)> pwrite;
    std::function<int(int fd, int mode, off_t offset, off_t size)> fallocate;
    std::function<int(int fd, off_t size)> ftruncate;
};

Hooks &TheHooks();

ssize_t RealWrite(int fd, const void *data, size_t size);

}  // namespace reliability
