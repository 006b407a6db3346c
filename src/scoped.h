/// \file
/// Owners of everything that has to be given back: descriptors, share records, a held configuration lock.
///
/// None of them can be cancelled while it gives back: a cancellation is an exception, and one that leaves a
/// destructor ends the process.
#ifndef FILEINDEX_SRC_SCOPED_H
#define FILEINDEX_SRC_SCOPED_H

#include <fileindex/config.h>

#include <vork/share.h>

#include <fcntl.h>
#include <pthread.h>
#include <unistd.h>

#include <cerrno>
#include <memory>
#include <string>
#include <utility>

namespace VORK::FILEINDEX::internal {

/// Holds a cancellation of the calling thread off until this object is gone.
class NoCancellation {
public:
    NoCancellation() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &before_); }
    ~NoCancellation() { pthread_setcancelstate(before_, nullptr); }
    NoCancellation(const NoCancellation &) = delete;
    NoCancellation &operator=(const NoCancellation &) = delete;

private:
    int before_ = PTHREAD_CANCEL_ENABLE;
};

/// `open`, after which a cancellation waits until the descriptor has an owner: it could land between the kernel's
/// answer and ours, and leave the descriptor open for ever.
inline int OpenUncancelled(const char *path, int flags, mode_t mode = 0) {
    const NoCancellation opening;
    return open(path, flags, mode);
}

class UniqueFd {
public:
    UniqueFd() = default;
    explicit UniqueFd(int fd) : fd_(fd) {}
    UniqueFd(UniqueFd &&other) noexcept : fd_(std::exchange(other.fd_, -1)) {}
    UniqueFd &operator=(UniqueFd &&other) noexcept {
        if (this != &other) {
            Close();
            fd_ = std::exchange(other.fd_, -1);
        }
        return *this;
    }
    ~UniqueFd() { Close(); }

    explicit operator bool() const { return fd_ >= 0; }
    int Get() const { return fd_; }

    /// False when the kernel reports at last that written data is lost. Keeps `errno` on success.
    bool Close() {
        if (fd_ < 0) {
            return true;
        }
        const NoCancellation closing;
        return close(std::exchange(fd_, -1)) == 0;
    }

private:
    int fd_ = -1;
};

struct ShareDeleter {
    void operator()(_tag_VORKSHARE *share) const {
        const NoCancellation freeing;
        VORKShareFree(share);
    }
};
using Share = std::unique_ptr<_tag_VORKSHARE, ShareDeleter>;

/// The share's record, or null. Calls the platform exactly once, and answers a record without a directory as a
/// failed look-up. A name with a NUL inside is no share's name; as a C string it would be another's.
inline Share FindShare(const std::string &name) {
    if (name.find('\0') != std::string::npos) {
        return nullptr;
    }
    const NoCancellation finding;  // or a record that was just made could get lost on its way here
    _tag_VORKSHARE *record = nullptr;
    if (VORKShareGet(name.c_str(), &record) < 0) {
        return nullptr;
    }
    Share share(record);
    if (share && share->szPath == nullptr) {
        return nullptr;
    }
    return share;
}

/// Unlocks a configuration on every way out of a manager, exceptions included, whether Lock succeeded or not:
/// a failed Lock leaves its last descriptor to Unlock.
class ConfigUnlocker {
public:
    explicit ConfigUnlocker(Config &config) : config_(config) {}
    ~ConfigUnlocker() {
        const NoCancellation unlocking;
        config_.Unlock();
    }
    ConfigUnlocker(const ConfigUnlocker &) = delete;
    ConfigUnlocker &operator=(const ConfigUnlocker &) = delete;

private:
    Config &config_;
};

}  // namespace VORK::FILEINDEX::internal

#endif
