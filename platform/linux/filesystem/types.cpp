// Type codes, and the C functions that hand them out.
#include "filesystem/types.h"

#include "common/failure.h"
#include "filesystem/loop_device.h"
#include "filesystem/path_mount.h"
#include "shares/share_source.h"

#include <vork/error.h>
#include <vork/filesystem.h>

#include <algorithm>
#include <cerrno>
#include <exception>
#include <iterator>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace VORK::PLATFORM {

namespace {

struct Row {
    std::string_view name;
    FsType code;
};

// Sorted by name. A FUSE file system that is not listed may be anything, so it is unknown.
constexpr Row kRows[] = {
    {"9p", kNetwork},
    {"afs", kNetwork},
    {"autofs", kAutomount},
    {"bcachefs", kOtherDisk},
    {"beegfs", kNetwork},
    {"bfs", kOtherDisk},
    {"binfmt_misc", kPseudo},
    {"bpf", kPseudo},
    {"btrfs", kBtrfs},
    {"ceph", kNetwork},
    {"cgroup", kPseudo},
    {"cgroup2", kPseudo},
    {"cifs", kNetwork},
    {"configfs", kPseudo},
    {"cpuset", kPseudo},
    {"cramfs", kImage},
    {"davfs", kNetwork},
    {"debugfs", kPseudo},
    {"devpts", kPseudo},
    {"devtmpfs", kPseudo},
    {"ecryptfs", kEncrypting},
    {"efivarfs", kPseudo},
    {"erofs", kImage},
    {"exfat", kOtherDisk},
    {"ext2", kExt2},
    {"ext3", kExt3},
    {"ext4", kExt4},
    {"f2fs", kOtherDisk},
    {"fuse.archivemount", kImage},
    {"fuse.ceph", kNetwork},
    {"fuse.cryfs", kEncrypting},
    {"fuse.davfs", kNetwork},
    {"fuse.encfs", kEncrypting},
    {"fuse.fuseiso", kImage},
    {"fuse.glusterfs", kNetwork},
    {"fuse.gocryptfs", kEncrypting},
    {"fuse.gvfsd-fuse", kNetwork},
    {"fuse.lxcfs", kPseudo},
    {"fuse.mergerfs", kUnion},
    {"fuse.portal", kPseudo},
    {"fuse.rclone", kNetwork},
    {"fuse.s3fs", kNetwork},
    {"fuse.squashfuse", kImage},
    {"fuse.sshfs", kNetwork},
    {"fuse.unionfs", kUnion},
    {"fuseblk", kOtherDisk},
    {"fusectl", kPseudo},
    {"gfs2", kOtherDisk},
    {"glusterfs", kNetwork},
    {"hfs", kOtherDisk},
    {"hfsplus", kOtherDisk},
    {"hugetlbfs", kPseudo},
    {"iso9660", kImage},
    {"jfs", kOtherDisk},
    {"lustre", kNetwork},
    {"mqueue", kPseudo},
    {"msdos", kOtherDisk},
    {"nfs", kNetwork},
    {"nfs4", kNetwork},
    {"nfsd", kPseudo},
    {"nilfs2", kOtherDisk},
    {"nsfs", kPseudo},
    {"ntfs", kOtherDisk},
    {"ntfs3", kOtherDisk},
    {"ocfs2", kOtherDisk},
    {"orangefs", kNetwork},
    {"overlay", kUnion},
    {"proc", kPseudo},
    {"pstore", kPseudo},
    {"ramfs", kMemory},
    {"reiserfs", kOtherDisk},
    {"resctrl", kPseudo},
    {"rpc_pipefs", kPseudo},
    {"securityfs", kPseudo},
    {"selinuxfs", kPseudo},
    {"smackfs", kPseudo},
    {"smb3", kNetwork},
    {"squashfs", kImage},
    {"sysfs", kPseudo},
    {"tmpfs", kMemory},
    {"tracefs", kPseudo},
    {"ubifs", kOtherDisk},
    {"udf", kImage},
    {"vfat", kOtherDisk},
    {"xfs", kXfs},
    {"zfs", kZfs},
    {"zonefs", kOtherDisk},
};

static_assert(std::is_sorted(std::begin(kRows), std::end(kRows),
                             [](const Row &a, const Row &b) { return a.name < b.name; }));

bool IsImageInShare(const Mount &mount) {
    const std::string backingFile = BackingFileOf(mount);
    return !backingFile.empty() && Shares().Current().table->Holding(backingFile) != nullptr;
}

}  // namespace

FsType CodeOfType(std::string_view name) {
    const auto *row = std::lower_bound(std::begin(kRows), std::end(kRows), name,
                                       [](const Row &a, std::string_view b) { return a.name < b; });
    if (row != std::end(kRows) && row->name == name) {
        return row->code;
    }
    return name.substr(0, 3) == "nfs" ? kNetwork : kUnknownType;
}

bool IsRemoteType(int type) {
    return type == kNetwork || type == kAutomount;
}

bool IsImageType(int type) {
    return type == kImage || type == kLoopMount;
}

}  // namespace VORK::PLATFORM

static_assert(kPseudo == VORK_FS_TYPE_PSEUDO);

int VORKGetFSType(const char *szPath, int flags) try {
    if (szPath == nullptr || flags != 0) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const std::optional<PathMount> found = FindMount(szPath);
    if (!found) {
        return FailErrno(errno);
    }
    const FsType type = CodeOfType(found->mount.type);
    if (type == kUnknownType) {
        return Fail(VORK_ERR_NOT_FOUND);
    }
    return IsImageInShare(found->mount) ? kLoopMount : type;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}

int VORKFSIsRemoteFS(int type) {
    return IsRemoteType(type) ? 1 : 0;
}

int VORKFSIsImageFS(int type) {
    return IsImageType(type) ? 1 : 0;
}
