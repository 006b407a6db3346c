#include "calls.h"

#include <sys/syscall.h>
#include <unistd.h>

namespace reliability {

Hooks &TheHooks() {
    static Hooks hooks;
    return hooks;
}

ssize_t RealWrite(int fd, const void *data, size_t size) {
    return ::syscall(SYS_write, fd, data, size);
}

}  // namespace reliability

using reliability::TheHooks;

extern "C" {

ssize_t write(int fd, const void *data, size_t size) {
    return TheHooks().write ? TheHooks().write(fd, data, size) : reliability::RealWrite(fd, data, size);
}

ssize_t pwrite(int fd, const void *data, size_t size, off_t offset) {
    return TheHooks().pwrite ? TheHooks().pwrite(fd, data, size, offset)
                             : ::syscall(SYS_pwrite64, fd, data, size, offset);
}

int fallocate(int fd, int mode, off_t offset, off_t size) {
    return TheHooks().fallocate ? TheHooks().fallocate(fd, mode, offset, size)
                                : static_cast<int>(::syscall(SYS_fallocate, fd, mode, offset, size));
}

int ftruncate(int fd, off_t size) noexcept {
    return TheHooks().ftruncate ? TheHooks().ftruncate(fd, size)
                                : static_cast<int>(::syscall(SYS_ftruncate, fd, size));
}

}  // extern "C"
