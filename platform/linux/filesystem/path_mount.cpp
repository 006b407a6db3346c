#include "filesystem/path_mount.h"

#include "filesystem/types.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>

namespace VORK::PLATFORM {

namespace {

constexpr int kMaxLinks = 40;

bool IsRemote(const Mount *mount) {
    return mount != nullptr && IsRemoteType(CodeOfType(mount->type));
}

// Resolves a path component by component. Each step asks the mount table first: where it leads into a network
// mount, links cannot be looked at and the text is taken as it stands.
class Walk {
public:
    explicit Walk(const MountTable &mounts) : mounts_(mounts) {}

    std::optional<std::string> Resolve(std::string path) {
        left_ = std::move(path);
        while (!left_.empty()) {
            if (!Step(TakeComponent())) {
                return std::nullopt;
            }
        }
        return done_.empty() ? "/" : done_;
    }

private:
    std::string TakeComponent() {
        const size_t end = std::min(left_.find('/'), left_.size());
        std::string component = left_.substr(0, end);
        left_.erase(0, end + 1);
        return component;
    }

    bool Step(const std::string &component) {
        if (component.empty() || component == ".") {
            return true;
        }
        if (component == "..") {
            done_.erase(std::min(done_.rfind('/'), done_.size()));
            return true;
        }
        const std::string next = done_ + "/" + component;
        if (IsRemote(mounts_.Holding(next))) {
            done_ = next;
            return true;
        }
        return Enter(next);
    }

    bool Enter(const std::string &next) {
        char target[PATH_MAX];
        const ssize_t length = readlink(next.c_str(), target, sizeof target);
        if (length < 0 && errno != EINVAL) {
            return false;
        }
        if (length < 0) {
            done_ = next;
            return true;
        }
        if (++links_ > kMaxLinks) {
            errno = ELOOP;
            return false;
        }
        if (target[0] == '/') {
            done_.clear();
        }
        left_ = std::string(target, static_cast<size_t>(length)) + "/" + left_;
        return true;
    }

    const MountTable &mounts_;
    std::string left_;
    std::string done_;
    int links_ = 0;
};

PathMount FromTableAlone(const std::string &path, const Mount &mount) {
    return {path, mount, IsRemote(&mount), mount.point == path};
}

// The kernel's own word on a path that is safe to ask about. Older kernels leave out what they do not know.
bool AskKernel(PathMount &result, const MountTable &mounts) {
    struct statx status {};
    const int flags = AT_NO_AUTOMOUNT | AT_SYMLINK_NOFOLLOW | AT_STATX_DONT_SYNC;
    if (statx(AT_FDCWD, result.path.c_str(), flags, STATX_MNT_ID, &status) != 0) {
        return false;
    }
    if ((status.stx_mask & STATX_MNT_ID) != 0) {
        if (const Mount *mount = mounts.WithId(status.stx_mnt_id)) {
            result.mount = *mount;
        }
    }
    if ((status.stx_attributes_mask & STATX_ATTR_MOUNT_ROOT) != 0) {
        result.isMountPoint = (status.stx_attributes & STATX_ATTR_MOUNT_ROOT) != 0;
    }
    return true;
}

}  // namespace

std::optional<PathMount> FindMount(const std::string &path) {
    if (path.empty() || path.front() != '/' || path.size() >= PATH_MAX) {
        errno = EINVAL;
        return std::nullopt;
    }
    const std::optional<MountTable> mounts = MountTable::Read();
    if (!mounts) {
        return std::nullopt;
    }
    const std::optional<std::string> canonical = Walk(*mounts).Resolve(path);
    if (!canonical) {
        return std::nullopt;
    }
    const Mount *mount = mounts->Holding(*canonical);
    if (mount == nullptr) {
        errno = ENOENT;
        return std::nullopt;
    }
    PathMount result = FromTableAlone(*canonical, *mount);
    if (!result.isRemote && !AskKernel(result, *mounts)) {
        return std::nullopt;
    }
    return result;
}

}  // namespace VORK::PLATFORM
