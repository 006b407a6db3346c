// Whether a path shows the present or a snapshot.
#include "base/path_cover.h"
#include "common/failure.h"
#include "filesystem/btrfs.h"
#include "filesystem/path_mount.h"
#include "filesystem/types.h"
#include "shares/share_source.h"

#include <vork/error.h>
#include <vork/filesystem.h>

#include <algorithm>
#include <cerrno>
#include <exception>
#include <memory>
#include <optional>
#include <string>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace {

constexpr std::string_view kZfsSnapshots = "/.zfs/snapshot";

bool IsInSnapshotsOfShare(const ShareTable &shares, std::string_view path) {
    const auto holding = shares.AllHolding(path);
    return std::any_of(holding.begin(), holding.end(), [path](const Share *share) {
        return !share->snapshot.empty() && IsAtOrUnder(path, share->path + "/" + share->snapshot);
    });
}

// Told by the name: looking below it would mount the snapshot.
bool IsInZfsSnapshotDirectory(const std::string &path) {
    const size_t start = path.find(kZfsSnapshots);
    if (start == std::string::npos || !IsAtOrUnder(path, path.substr(0, start + kZfsSnapshots.size()))) {
        return false;
    }
    const std::optional<PathMount> dataSet = FindMount(start == 0 ? "/" : path.substr(0, start));
    return dataSet && CodeOfType(dataSet->mount.type) == kZfs;
}

// A share kept in a subvolume that was once made as a snapshot (after a restore, say) is live.
bool IsSubvolumeOfShare(const ShareTable &shares, const std::string &path, const Subvolume &subvolume) {
    const Share *share = shares.Holding(path);
    const std::optional<Subvolume> live = share == nullptr ? std::nullopt : SubvolumeOf(share->path);
    return live && live->IsSameAs(subvolume);
}

// 1, 0, or a negative result with the platform error set.
int IsInSnapshot(const std::string &path) {
    const std::shared_ptr<const ShareTable> shares = Shares().Current().table;
    if (IsInSnapshotsOfShare(*shares, path) || IsInZfsSnapshotDirectory(path)) {
        return 1;
    }
    const std::optional<PathMount> found = FindMount(path);
    if (!found) {
        return FailErrno(errno);
    }
    const FsType type = CodeOfType(found->mount.type);
    if (type == kZfs) {
        return found->mount.source.find('@') != std::string::npos ? 1 : 0;
    }
    if (type != kBtrfs) {
        return 0;
    }
    const std::optional<Subvolume> subvolume = SubvolumeOf(found->path);
    if (!subvolume) {
        return FailErrno(errno);
    }
    return subvolume->isSnapshot && !IsSubvolumeOfShare(*shares, path, *subvolume) ? 1 : 0;
}

}  // namespace

int VLIBFhsPathInSnapshot(const char *szPath, int *pInSnapshot) try {
    if (szPath == nullptr || pInSnapshot == nullptr) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const int result = IsInSnapshot(szPath);
    if (result < 0) {
        return result;
    }
    *pInSnapshot = result;
    return 0;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}
