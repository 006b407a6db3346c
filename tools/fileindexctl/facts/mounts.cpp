#include "facts/mounts.h"

#include <fcntl.h>
#include <sys/stat.h>

namespace VORK::FILEINDEXCTL {

namespace {

std::optional<Mount> Copy(const Mount *mount) {
    return mount == nullptr ? std::nullopt : std::optional(*mount);
}

}  // namespace

std::optional<Mount> MountOf(const std::string &path) {
    struct statx status {};
    const bool isKnown =
        statx(AT_FDCWD, path.c_str(), AT_NO_AUTOMOUNT | AT_STATX_DONT_SYNC, STATX_MNT_ID, &status) == 0 &&
        (status.stx_mask & STATX_MNT_ID) != 0;
    const auto mounts = isKnown ? MountTable::Read() : std::nullopt;
    return mounts ? Copy(mounts->WithId(status.stx_mnt_id)) : std::nullopt;
}

std::optional<Mount> MountAbove(const std::string &path) {
    const auto mounts = MountTable::Read();
    return mounts ? Copy(mounts->Holding(path)) : std::nullopt;
}

std::string MountText(const Mount &mount) {
    return mount.type + (mount.source.empty() ? "" : " (" + mount.source + ")") + ", mounted on " + mount.point;
}

}  // namespace VORK::FILEINDEXCTL
