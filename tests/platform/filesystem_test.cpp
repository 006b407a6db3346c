// File systems, on real mounts.
//
//   /vol1/images        image files inside the share "images"
//   /mnt/...            where things are mounted
#include "support.h"

#include <vork/filesystem.h>
#include <vork/quota.h>
#include <vork/share.h>

#include <fcntl.h>
#include <linux/fscrypt.h>
#include <sys/ioctl.h>

#include <cstring>

using platform_test::HasProgram;
using platform_test::kConfiguration;
using platform_test::Mounts;
using platform_test::Shell;
using platform_test::WriteFile;

namespace {

enum class Kind { kLocal, kRemote, kImage, kPseudo, kUnknown };

std::ostream &operator<<(std::ostream &out, Kind kind) {
    static const char *const names[] = {"local", "remote", "image", "pseudo", "unknown"};
    return out << names[static_cast<int>(kind)];
}

Kind KindOf(const std::string &path) {
    const int type = VORKGetFSType(path.c_str(), 0);
    if (type < 0) {
        return Kind::kUnknown;
    }
    if (VORKFSIsRemoteFS(type) != 0) {
        return Kind::kRemote;
    }
    if (VORKFSIsImageFS(type) != 0) {
        return Kind::kImage;
    }
    return type == VORK_FS_TYPE_PSEUDO ? Kind::kPseudo : Kind::kLocal;
}

int ReadOnly(const char *path) {
    const VORKSHARE share{"share", 0, path};
    int readOnly = -9;
    return VLIBShareIsReadOnlyGet(&share, &readOnly) < 0 ? -1 : readOnly;
}

// "plain", "unlocked", "locked" or "failed".
std::string Encryption(const char *path) {
    const VORKSHARE share{"share", 0, path};
    int kind = -9;
    int locked = -9;
    if (VLIBShareIsEncryptionGet(&share, &kind) < 0 || VLIBShareIsEncryptedGet(&share, &locked) < 0) {
        return "failed";
    }
    return kind == 0 ? "plain" : locked == 1 ? "locked" : "unlocked";
}

int InSnapshot(const std::string &path) {
    int inSnapshot = -9;
    return VLIBFhsPathInSnapshot(path.c_str(), &inSnapshot) < 0 ? -1 : inSnapshot;
}

class FileSystemTest : public testing::Test {
protected:
    void SetUp() override {
        WriteFile(kConfiguration, R"({"shares": {"images": {"path": "/vol1/images"},
            "photo": {"path": "/vol1/photo", "snapshot": "#snapshot"}}})");
        std::filesystem::create_directories("/vol1/photo/2015");
    }

    Mounts mounts_;
};

TEST_F(FileSystemTest, TellsKindsApart) {
    ASSERT_TRUE(mounts_.Mount("none", "/mnt/memory", "-t tmpfs"));
    ASSERT_TRUE(mounts_.Mount("proc", "/mnt/two words\t\\x/proc", "-t proc"));
    ASSERT_TRUE(mounts_.MountImage("/vol2/disk.img", 8, "mkfs.ext4 -q -F $IMAGE", "/mnt/disk"));
    ASSERT_TRUE(mounts_.MountImage("/vol1/images/disk.img", 8, "mkfs.ext4 -q -F $IMAGE", "/mnt/image"));
    ASSERT_TRUE(mounts_.Mount("/mnt/image", "/mnt/memory/bound", "--bind"));
    ASSERT_TRUE(mounts_.Mount("none", "/mnt/memory/hidden", "-t tmpfs"));
    std::filesystem::create_directories("/mnt/memory/hidden/below");
    ASSERT_TRUE(mounts_.Mount("proc", "/mnt/memory/hidden", "-t proc"));
    std::filesystem::create_symlink("../two words\t\\x/proc/1", "/mnt/memory/link");
    std::filesystem::create_symlink("loop", "/mnt/memory/loop");
    WriteFile("/mnt/memory/file", "");
    const struct {
        const char *path;
        Kind kind;
        int mountPoint;
    } rows[] = {
        {"/vol1/photo", Kind::kLocal, 0},
        {"/vol1", Kind::kLocal, 1},
        {"/vol1/", Kind::kLocal, 1},
        {"/", Kind::kLocal, 1},
        {"/proc/self/fd", Kind::kPseudo, 0},
        {"/sys", Kind::kPseudo, 1},
        {"/mnt/memory/file", Kind::kLocal, 0},
        {"/mnt/two words\t\\x/proc/1", Kind::kPseudo, 0},
        {"/mnt/two words\t\\x", Kind::kLocal, 0},
        {"/mnt/disk/lost+found", Kind::kLocal, 0},
        {"/mnt/image/lost+found", Kind::kImage, 0},
        {"/mnt/memory/bound", Kind::kImage, 1},
        {"/mnt/memory/bound/..", Kind::kLocal, 1},
        {"/mnt/memory/hidden/1", Kind::kPseudo, 0},
        {"/mnt/memory/hidden/below", Kind::kUnknown, -1},
        {"/mnt/memory/link/fd", Kind::kPseudo, 0},
        {"/mnt/memory/loop", Kind::kUnknown, -1},
        {"/mnt/memory/file/below", Kind::kUnknown, -1},
        {"/mnt/missing", Kind::kUnknown, -1},
        {"relative", Kind::kUnknown, -1},
        {"", Kind::kUnknown, -1},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(KindOf(row.path), row.kind) << row.path;
        EXPECT_EQ(VORKFSDirIsMntPoint(row.path) < 0 ? -1 : VORKFSDirIsMntPoint(row.path), row.mountPoint)
            << row.path;
    }
}

TEST_F(FileSystemTest, KnowsReadOnlyImages) {
    if (!HasProgram("mksquashfs")) {
        GTEST_SKIP() << "squashfs-tools are not installed";
    }
    ASSERT_TRUE(mounts_.MountImage("/vol2/tree.img", 0, "rm $IMAGE; mksquashfs /vol1 $IMAGE", "/mnt/squash"));
    EXPECT_EQ(KindOf("/mnt/squash/photo"), Kind::kImage);
    EXPECT_EQ(ReadOnly("/mnt/squash/photo"), 1);
}

// A server that never answers: whoever looks below the mount waits for ever.
TEST_F(FileSystemTest, DoesNotHangOnADeadServer) {
    const int server = open("/dev/fuse", O_RDWR | O_CLOEXEC);
    if (server < 0) {
        GTEST_SKIP() << "no /dev/fuse";
    }
    std::filesystem::create_directories("/mnt/dead server");
    const std::string options = "fd=" + std::to_string(server) + ",rootmode=40000,user_id=0,group_id=0";
    ASSERT_EQ(mount("server:/", "/mnt/dead server", "fuse.sshfs", 0, options.c_str()), 0) << std::strerror(errno);
    std::filesystem::create_symlink("/mnt/dead server/x", "/vol1/photo/to-dead");
    alarm(60);
    for (const char *path : {"/mnt/dead server", "/mnt/dead server/a/b", "/vol1/photo/to-dead/y",
                             "/mnt/dead server/../dead server/x"}) {
        EXPECT_EQ(KindOf(path), Kind::kRemote) << path;
        EXPECT_EQ(InSnapshot(path), 0) << path;
        EXPECT_EQ(ReadOnly(path), 0) << path;
        EXPECT_EQ(Encryption(path), "plain") << path;
        EXPECT_EQ(VORKQuotaIsEnough(0, path, 1), 0) << path;
        EXPECT_EQ(VLIBCErrGet(), VORK_ERR_IO) << path;
    }
    EXPECT_EQ(VORKFSDirIsMntPoint("/mnt/dead server"), 1);
    EXPECT_EQ(VORKFSDirIsMntPoint("/mnt/dead server/a"), 0);
    EXPECT_EQ(KindOf("/mnt/dead server/../.."), Kind::kLocal);
    alarm(0);
    umount2("/mnt/dead server", MNT_DETACH | MNT_FORCE);
    close(server);
}

TEST_F(FileSystemTest, KnowsReadOnlyMounts) {
    ASSERT_TRUE(mounts_.Mount("none", "/mnt/whole", "-t tmpfs -o ro"));
    ASSERT_TRUE(mounts_.Mount("/vol1/photo", "/mnt/view", "--bind"));
    ASSERT_EQ(Shell("mount -n -o remount,bind,ro /mnt/view"), 0);
    EXPECT_EQ(ReadOnly("/mnt/whole"), 1);
    EXPECT_EQ(ReadOnly("/mnt/view/2015"), 1) << "the mount, not the file system";
    EXPECT_EQ(ReadOnly("/vol1/photo/2015"), 0);
    EXPECT_EQ(ReadOnly("/vol1/missing"), -1);
}

TEST_F(FileSystemTest, CountsFreeBlocks) {
    ASSERT_TRUE(mounts_.Mount("none", "/mnt/small", "-t tmpfs -o size=1m"));
    const struct {
        const char *path;
        unsigned long long required;
        bool enough;
        int code;
    } rows[] = {
        {"/mnt/small", 0, true, 0},
        {"/mnt/small", 1048576, true, 0},
        {"/mnt/small", 1048577, false, VORK_ERR_NO_SPACE},
        {"/mnt/small", ~0ULL, false, VORK_ERR_NO_SPACE},
        {"/mnt/missing", 0, false, VORK_ERR_NOT_FOUND},
        {nullptr, 0, false, VORK_ERR_BAD_PARAMETER},
    };
    for (const auto &row : rows) {
        VLIBCErrSetEx(0, "", 0);
        EXPECT_EQ(VORKQuotaIsEnough(0, row.path, row.required) != 0, row.enough) << row.required;
        EXPECT_EQ(VLIBCErrGet(), row.code) << row.required;
    }
}

TEST_F(FileSystemTest, KnowsTheSnapshotDirectoriesOfShares) {
    const struct {
        const char *path;
        int inSnapshot;
    } rows[] = {
        {"/vol1/photo/#snapshot/daily/x", 1},
        {"/vol1/photo/#snapshots", -1},
        {"/vol1/photo/2015", 0},
        {"/vol1/photo/missing", -1},
        {"/vol1/images/#snapshot/x", -1},
        {"/vol1/photo/.zfs/snapshot/x", -1},  // not on ZFS
    };
    for (const auto &row : rows) {
        EXPECT_EQ(InSnapshot(row.path), row.inSnapshot) << row.path;
    }
}

TEST_F(FileSystemTest, KnowsTheSubvolumesOfBtrfs) {
    if (!HasProgram("mkfs.btrfs")) {
        GTEST_SKIP() << "btrfs-progs are not installed";
    }
    ASSERT_TRUE(mounts_.MountImage("/vol2/btrfs.img", 128, "mkfs.btrfs -q -f $IMAGE", "/mnt/btrfs"));
    ASSERT_EQ(
        Shell("cd /mnt/btrfs && { btrfs subvolume create music && mkdir -p music/a && touch music/a/file &&"
              " mkfifo music/a/pipe &&"
              " btrfs subvolume snapshot -r music music/daily && btrfs subvolume snapshot music writable &&"
              " btrfs subvolume snapshot music restored && btrfs subvolume snapshot restored restored/weekly &&"
              " btrfs subvolume create sealed && btrfs property set sealed ro true; } >/tmp/btrfs.log 2>&1"),
        0);
    WriteFile(kConfiguration, R"({"shares": {"music": {"path": "/mnt/btrfs/music"},
                                             "restored": {"path": "/mnt/btrfs/restored"}}})");
    const struct {
        const char *path;
        int inSnapshot, readOnly;
    } rows[] = {
        {"/mnt/btrfs", 0, 0},
        {"/mnt/btrfs/music", 0, 0},
        {"/mnt/btrfs/music/a/pipe", 0, 0},
        {"/mnt/btrfs/music/daily", 1, 1},
        {"/mnt/btrfs/music/daily/a/file", 1, 1},
        {"/mnt/btrfs/writable/a", 1, 0},
        {"/mnt/btrfs/restored/a", 0, 0},  // a share in what was once a snapshot
        {"/mnt/btrfs/restored/weekly/a", 1, 0},
        {"/mnt/btrfs/sealed", 0, 1},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(InSnapshot(row.path), row.inSnapshot) << row.path;
        EXPECT_EQ(ReadOnly(row.path), row.readOnly) << row.path;
        EXPECT_EQ(KindOf(row.path), Kind::kLocal) << row.path;
    }
    EXPECT_EQ(VORKFSDirIsMntPoint("/mnt/btrfs/music"), 0) << "a subvolume is no mount";
    EXPECT_EQ(VORKFSDirIsMntPoint("/mnt/btrfs"), 1);
}

TEST_F(FileSystemTest, MindsTheQuotaGroupsOfBtrfs) {
    if (!HasProgram("mkfs.btrfs")) {
        GTEST_SKIP() << "btrfs-progs are not installed";
    }
    ASSERT_TRUE(mounts_.MountImage("/vol1/images/btrfs.img", 128, "mkfs.btrfs -q -f $IMAGE", "/mnt/btrfs"));
    EXPECT_EQ(KindOf("/mnt/btrfs"), Kind::kImage) << "also where the mount has a device number of its own";
    ASSERT_EQ(Shell("cd /mnt/btrfs && { btrfs subvolume create free && btrfs subvolume create own &&"
                    " btrfs subvolume create outer && btrfs quota enable . &&"
                    " btrfs qgroup limit 8M own && btrfs qgroup create 1/100 . && btrfs qgroup limit 4M 1/100 . &&"
                    " { btrfs qgroup assign 0/$(btrfs inspect-internal rootid outer) 1/100 . || true; } &&"
                    " btrfs quota rescan -w . ; } >/tmp/btrfs.log 2>&1"),
              0)
        << platform_test::ReadText("/tmp/btrfs.log");
    const struct {
        const char *path;
        unsigned long long megabytes;
        bool enough;
        int code;
    } rows[] = {
        {"/mnt/btrfs/free", 10, true, 0}, {"/mnt/btrfs/free", 1000, false, VORK_ERR_NO_SPACE},
        {"/mnt/btrfs/own", 6, true, 0},   {"/mnt/btrfs/own", 10, false, VORK_ERR_QUOTA},
        {"/mnt/btrfs/outer", 3, true, 0}, {"/mnt/btrfs/outer", 6, false, VORK_ERR_QUOTA},
    };
    for (const auto &row : rows) {
        VLIBCErrSetEx(0, "", 0);
        EXPECT_EQ(VORKQuotaIsEnough(0, row.path, row.megabytes << 20U) != 0, row.enough)
            << row.path << " " << row.megabytes;
        EXPECT_EQ(VLIBCErrGet(), row.code) << row.path << " " << row.megabytes;
    }
}

TEST_F(FileSystemTest, KnowsEncryptedDirectories) {
    ASSERT_TRUE(mounts_.MountImage("/vol2/crypt.img", 16, "mkfs.ext4 -q -F -O encrypt $IMAGE", "/mnt/crypt"));
    std::filesystem::create_directories("/mnt/crypt/secret");
    std::filesystem::create_directories("/mnt/crypt/open");
    const int volume = open("/mnt/crypt", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    const int secret = open("/mnt/crypt/secret", O_RDONLY | O_DIRECTORY | O_CLOEXEC);

    alignas(fscrypt_add_key_arg) char storage[sizeof(fscrypt_add_key_arg) + FSCRYPT_MAX_KEY_SIZE] = {};
    auto *key = reinterpret_cast<fscrypt_add_key_arg *>(storage);
    key->key_spec.type = FSCRYPT_KEY_SPEC_TYPE_IDENTIFIER;
    key->raw_size = FSCRYPT_MAX_KEY_SIZE;
    if (ioctl(volume, FS_IOC_ADD_ENCRYPTION_KEY, key) != 0) {
        GTEST_SKIP() << "the kernel does not encrypt directories: " << std::strerror(errno);
    }
    fscrypt_policy_v2 policy{};
    policy.version = FSCRYPT_POLICY_V2;
    policy.contents_encryption_mode = FSCRYPT_MODE_AES_256_XTS;
    policy.filenames_encryption_mode = FSCRYPT_MODE_AES_256_CTS;
    policy.flags = FSCRYPT_POLICY_FLAGS_PAD_32;
    std::memcpy(policy.master_key_identifier, key->key_spec.u.identifier, FSCRYPT_KEY_IDENTIFIER_SIZE);
    ASSERT_EQ(ioctl(secret, FS_IOC_SET_ENCRYPTION_POLICY, &policy), 0) << std::strerror(errno);
    close(secret);

    EXPECT_EQ(Encryption("/mnt/crypt/secret"), "unlocked");
    EXPECT_EQ(Encryption("/mnt/crypt/open"), "plain");
    EXPECT_EQ(Encryption("/vol1/photo"), "plain");
    EXPECT_EQ(Encryption("/mnt/crypt/missing"), "failed");

    fscrypt_remove_key_arg removal{};
    removal.key_spec = key->key_spec;
    ASSERT_EQ(ioctl(volume, FS_IOC_REMOVE_ENCRYPTION_KEY, &removal), 0) << std::strerror(errno);
    EXPECT_EQ(Encryption("/mnt/crypt/secret"), "locked");
    close(volume);
}

}  // namespace
