#include "base/json/text.h"
#include "base/unique_fd.h"
#include "config/load_save.h"
#include "records.h"

#include <fileindex/config.h>
#include <fileindex/error.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>

namespace VORK {
namespace FILEINDEX {

using internal::kConfigModule;

namespace {

constexpr int kLockAttempts = 3;

/// /tmp is open to everyone. A lock on a file that has lost its name, or that a stranger made and can take away at
/// any moment, would keep nobody out who finds another file there.
bool IsTrustworthy(int fd) {
    struct stat status = {};
    return fstat(fd, &status) == 0 && S_ISREG(status.st_mode) && status.st_nlink > 0 &&
           (status.st_uid == 0 || status.st_uid == geteuid());
}

}  // namespace

Config::Config() : document_(Json::objectValue), lock_fd_(-1) {}

Config::~Config() = default;

bool Config::Lock(bool exclusive) {
    const int operation = (exclusive ? LOCK_EX : LOCK_SH) | LOCK_NB;
    for (int attempt = 0; attempt < kLockAttempts; ++attempt) {
        if (attempt > 0) {
            const NoCancellation closing;
            close(lock_fd_);
            lock_fd_ = -1;
        }
        // Non-blocking: a stranger's lease on the file would hold the call for the kernel's whole grace time.
        constexpr int kFlags = O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK;
        lock_fd_ = Open(GetLockPath().c_str(), kFlags, 0644).Release();
        if (lock_fd_ < 0) {
            break;
        }
        if (flock(lock_fd_, operation) == 0) {
            if (IsTrustworthy(lock_fd_)) {
                return true;
            }
        } else if (errno != EINTR && errno != EAGAIN) {
            break;
        }
        // Up to 9 ms, so that processes that collided once do not collide for ever.
        usleep(static_cast<useconds_t>(rand() % 10) * 1000);
    }
    // The status file's lock is reported in the same words; support tools know the record by them.
    syslog(LOG_ERR, "%s:%d Failed to lock folder", kConfigModule, __LINE__);
    ErrorHandler::SetError(FILEINDEX_ERR_LOCK);
    return false;
}

void Config::Unlock() {
    if (lock_fd_ < 0) {
        return;
    }
    const NoCancellation closing;
    flock(lock_fd_, LOCK_UN);
    close(lock_fd_);
}

bool Config::LoadJson() {
    return internal::LoadConfig(GetPath(),
                                [this](const std::string &text) { return JsonReader().Parse(text, document_); });
}

bool Config::SaveJson() {
    return internal::SaveConfig(GetPath(), [this](std::string &text) {
        text = ToString(document_) + '\n';
        return CanBeWritten(document_);
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
