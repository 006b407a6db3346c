#include "json/file.h"
#include "names.h"

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

enum class Presence { kMissing, kPresent, kUnknown };

/// Only a path that certainly has no regular file counts as missing: a file that cannot be looked at is there
/// all the same, and treating it as missing would let the next save erase it.
Presence PresenceOf(const std::string &path) {
    struct stat status = {};
    if (lstat(path.c_str(), &status) == 0) {
        return S_ISREG(status.st_mode) ? Presence::kPresent : Presence::kMissing;
    }
    return errno == ENOENT || errno == ENOTDIR ? Presence::kMissing : Presence::kUnknown;
}

}  // namespace

Config::Config() : document_(Json::objectValue), lock_fd_(-1) {}

Config::~Config() = default;

bool Config::Lock(bool exclusive) {
    const int operation = (exclusive ? LOCK_EX : LOCK_SH) | LOCK_NB;
    for (int attempt = 0; attempt < kLockAttempts; ++attempt) {
        if (attempt > 0) {
            close(lock_fd_);
        }
        lock_fd_ = open(GetLockPath().c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0644);
        if (lock_fd_ < 0) {
            break;
        }
        if (flock(lock_fd_, operation) == 0) {
            return true;
        }
        if (errno != EINTR && errno != EAGAIN) {
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
    flock(lock_fd_, LOCK_UN);
    close(lock_fd_);
}

bool Config::LoadJson() {
    const std::string path = GetPath();
    const Presence presence = PresenceOf(path);
    if (presence == Presence::kMissing) {
        return true;
    }
    if (presence == Presence::kPresent && internal::FromFile(path, document_)) {
        return true;
    }
    syslog(LOG_ERR, "%s:%d Failed to load json from %s", kConfigModule, __LINE__, path.c_str());
    ErrorHandler::SetError(FILEINDEX_ERR_LOAD_JSON);
    return false;
}

bool Config::SaveJson() {
    const std::string path = GetPath();
    if (!internal::ToFile(path, document_)) {
        syslog(LOG_ERR, "%s:%d Failed to save json to %s", kConfigModule, __LINE__, path.c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_SAVE_JSON);
        return false;
    }
    if (chmod(path.c_str(), 0644) == -1) {
        syslog(LOG_ERR, "%s:%d chmod failed, path=%s", kConfigModule, __LINE__, path.c_str());
    }
    return true;
}

}  // namespace FILEINDEX
}  // namespace VORK
