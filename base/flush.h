/// \file
/// Bringing what was written to the disk.
#pragma once

#include <unistd.h>

#include <cerrno>

namespace VORK {

/// Calls `flush` (fsync or fdatasync). A file system that knows no flush counts as flushed.
inline bool Flush(int (*flush)(int), int fd) {
    constexpr int kMaxInterruptions = 100;
    for (int interruptions = 0; flush(fd) != 0; ++interruptions) {
        if (errno == EINVAL || errno == ENOSYS) {
            return true;
        }
        if (errno != EINTR || interruptions == kMaxInterruptions) {
            return false;
        }
    }
    return true;
}

}  // namespace VORK
