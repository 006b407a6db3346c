#include "common/file_lock.h"

#include <fcntl.h>
#include <sys/file.h>

#include <cerrno>
#include <chrono>
#include <thread>

namespace VORK::PLATFORM {

namespace {

constexpr std::chrono::milliseconds kLockWait{2000};
constexpr std::chrono::milliseconds kLockRetry{2};

}  // namespace

FileLock::~FileLock() {
    if (file_) {
        flock(file_.Get(), LOCK_UN);
    }
}

std::optional<FileLock> TakeLock(const std::string &lockPath) {
    UniqueFd file = Open(lockPath.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0600);
    if (!file) {
        return std::nullopt;
    }
    const auto deadline = std::chrono::steady_clock::now() + kLockWait;
    while (flock(file.Get(), LOCK_EX | LOCK_NB) != 0) {
        if (errno != EWOULDBLOCK && errno != EINTR) {
            return std::nullopt;
        }
        if (std::chrono::steady_clock::now() >= deadline) {
            errno = ETIMEDOUT;
            return std::nullopt;
        }
        std::this_thread::sleep_for(kLockRetry);
    }
    return FileLock(std::move(file));
}

}  // namespace VORK::PLATFORM
