#include "config/load_save.h"
#include "json/text.h"
#include "names.h"

#include <fileindex/config.h>
#include <fileindex/error.h>

#include <fcntl.h>
#include <sys/file.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <new>

namespace VORK {
namespace FILEINDEX {

using internal::kConfigModule;

namespace {

constexpr int kLockAttempts = 3;

}  // namespace

Config::Config() : document_(Json::objectValue), lock_fd_(-1) {}

Config::~Config() = default;

bool Config::Lock(bool exclusive) {
    const int operation = (exclusive ? LOCK_EX : LOCK_SH) | LOCK_NB;
    for (int attempt = 0; attempt < kLockAttempts; ++attempt) {
        if (attempt > 0) {
            close(lock_fd_);
            lock_fd_ = -1;
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
    return internal::LoadConfig(GetPath(), [this](const std::string &text) {
        unparsed_.clear();
        return internal::JsonReader().Parse(text, document_);
    });
}

bool Config::SaveJson() {
    return internal::SaveConfig(GetPath(), [this] {
        if (!unparsed_.empty()) {
            if (!internal::JsonReader().Parse(unparsed_, document_)) {
                throw std::bad_alloc();  // it has been parsed before; an empty document must not take its place
            }
            unparsed_.clear();
        }
        return internal::ToString(document_) + '\n';
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
