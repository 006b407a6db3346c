#include "base/metadata_entry.h"

#include <fcntl.h>

#include <cerrno>

namespace VORK {

namespace {

constexpr mode_t kNewFileMode = 0644;

}  // namespace

MetadataEntry::MetadataEntry(const std::string &path) : name_(path.substr(path.rfind('/') + 1)) {
    const NoCancellation opening;  // or the new descriptor could get lost on its way here
    // O_PATH: who may not list the directory may still know its files.
    constexpr int kFlags = O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
    directory_ = UniqueFd(open(path.substr(0, path.rfind('/')).c_str(), kFlags));
    error_ = errno;
}

bool MetadataEntry::HasDirectory() const {
    if (!directory_) {
        errno = error_;
    }
    return static_cast<bool>(directory_);
}

UniqueFd MetadataEntry::OpenFile(int flags, struct stat &status) const {
    if (!HasDirectory()) {
        return {};
    }
    const NoCancellation opening;
    UniqueFd fd(
        openat(directory_.Get(), name_.c_str(), flags | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC, kNewFileMode));
    if (!fd || fstat(fd.Get(), &status) != 0) {
        return {};
    }
    if (!S_ISREG(status.st_mode)) {
        errno = EINVAL;
        return {};
    }
    if (status.st_nlink > 1) {  // none at all is a file that has just been taken away
        errno = EMLINK;
        return {};
    }
    return fd;
}

bool MetadataEntry::Look(struct stat &status) const {
    return HasDirectory() && fstatat(directory_.Get(), name_.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0;
}

bool MetadataEntry::MakeDirectory(mode_t mode) const {
    return HasDirectory() && mkdirat(directory_.Get(), name_.c_str(), mode) == 0;
}

}  // namespace VORK
