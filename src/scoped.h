/// \file
/// Owners of everything that has to be given back: descriptors, share records, a held configuration lock.
#ifndef FILEINDEX_SRC_SCOPED_H
#define FILEINDEX_SRC_SCOPED_H

#include <fileindex/config.h>

#include <vork/share.h>

#include <unistd.h>

#include <cerrno>
#include <memory>
#include <string>
#include <utility>

namespace VORK::FILEINDEX::internal {

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
        return close(std::exchange(fd_, -1)) == 0;
    }

private:
    int fd_ = -1;
};

struct ShareDeleter {
    void operator()(_tag_VORKSHARE *share) const { VORKShareFree(share); }
};
using Share = std::unique_ptr<_tag_VORKSHARE, ShareDeleter>;

/// The share's record, or null. Calls the platform exactly once, and answers a record without a directory as a
/// failed look-up. A name with a NUL inside is no share's name; as a C string it would be another's.
inline Share FindShare(const std::string &name) {
    if (name.find('\0') != std::string::npos) {
        return nullptr;
    }
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
    ~ConfigUnlocker() { config_.Unlock(); }
    ConfigUnlocker(const ConfigUnlocker &) = delete;
    ConfigUnlocker &operator=(const ConfigUnlocker &) = delete;

private:
    Config &config_;
};

}  // namespace VORK::FILEINDEX::internal

#endif
