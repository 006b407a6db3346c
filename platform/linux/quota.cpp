// Room on a volume: free blocks, btrfs quota groups, a user's quota.
#include "base/unique_fd.h"
#include "common/failure.h"
#include "filesystem/btrfs.h"
#include "filesystem/path_mount.h"
#include "filesystem/types.h"

#include <vork/error.h>
#include <vork/quota.h>

#include <fcntl.h>
#include <sys/quota.h>
#include <sys/statvfs.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <exception>
#include <optional>
#include <string>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace {

constexpr uint64_t kQuotaBlock = 1024;

// 0 when there is room, else the platform error. "Volume" is any directory on it.
int WhyNotOnVolume(int volume, uint64_t required) {
    struct statvfs room {};
    if (fstatvfs(volume, &room) != 0) {
        return CodeOfErrno(errno);
    }
    return static_cast<uint64_t>(room.f_bavail) * room.f_frsize < required ? VORK_ERR_NO_SPACE : 0;
}

// Quotas that cannot be read, most often because there are none, limit nothing. The superuser has none.
int WhyNotForUser(int volume, unsigned int uid, uint64_t required) {
    dqblk quota{};
    if (uid == 0 || syscall(SYS_quotactl_fd, volume, QCMD(Q_GETQUOTA, USRQUOTA), uid, &quota) != 0) {
        return 0;
    }
    const uint64_t limit = quota.dqb_bhardlimit * kQuotaBlock;
    const bool isOver = limit != 0 && (quota.dqb_curspace > limit || limit - quota.dqb_curspace < required);
    return isOver ? VORK_ERR_QUOTA : 0;
}

int WhyNotInGroups(const PathMount &place, uint64_t required) {
    if (CodeOfType(place.mount.type) != kBtrfs) {
        return 0;
    }
    const std::optional<uint64_t> room = RoomInQuotaGroups(place.path);
    return room && *room < required ? VORK_ERR_QUOTA : 0;
}

int WhyNot(unsigned int uid, const char *path, uint64_t required) {
    const std::optional<PathMount> place = FindMount(path);
    if (!place) {
        return CodeOfErrno(errno);
    }
    if (place->isRemote) {
        return VORK_ERR_IO;  // asking could hang
    }
    const UniqueFd volume = Open(place->path.c_str(), O_RDONLY | O_NONBLOCK | O_NOFOLLOW | O_CLOEXEC);
    if (!volume) {
        return CodeOfErrno(errno);
    }
    int error = WhyNotInGroups(*place, required);
    error = error != 0 ? error : WhyNotForUser(volume.Get(), uid, required);
    return error != 0 ? error : WhyNotOnVolume(volume.Get(), required);
}

}  // namespace

int VORKQuotaIsEnough(unsigned int uid, const char *szPath, unsigned long long cbRequired) try {
    const int error = szPath == nullptr ? VORK_ERR_BAD_PARAMETER : WhyNot(uid, szPath, cbRequired);
    if (error == 0) {
        return 1;
    }
    Fail(error);
    return 0;
} catch (const std::exception &) {
    Fail(VORK_ERR_IO);
    return 0;
}
