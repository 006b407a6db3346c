/// \file
/// Shares from the platform's own file, "/usr/vork/etc/platform.conf".
#pragma once

#include "shares/share_source.h"

#include <sys/stat.h>

#include <mutex>
#include <string>

namespace VORK::PLATFORM {

/// Keeps the parsed table for as long as the file's identity stays the same. A missing file means no shares.
class PlatformFileShares final : public ShareSource {
public:
    explicit PlatformFileShares(std::string path) : path_(std::move(path)) {}

    Snapshot Current() override;

    /// Around a fork, so that the child is not left with a mutex that a thread it does not have was holding.
    void BeforeFork() { mutex_.lock(); }
    void AfterFork() { mutex_.unlock(); }

private:
    struct Identity {
        dev_t device = 0;
        ino_t inode = 0;
        off_t size = -1;
        timespec modified{};
        timespec changed{};

        bool operator==(const Identity &other) const;
    };

    static Identity IdentityOf(const struct stat &status);
    bool IsKnown(const struct stat &status) const;
    void Load();
    bool LoadText(int fd);
    void Keep(int error);

    const std::string path_;
    std::mutex mutex_;
    Identity identity_;
    bool mayHaveChangedUnseen_ = true;
    Snapshot snapshot_{std::make_shared<const ShareTable>(), 0};
};

}  // namespace VORK::PLATFORM
