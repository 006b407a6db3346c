// A server that never answers, and encrypted directories; all else about file systems is in the transcripts.
#include "support.h"

#include <vork/filesystem.h>
#include <vork/quota.h>
#include <vork/share.h>

#include <linux/fscrypt.h>
#include <sys/ioctl.h>

#include <cerrno>
#include <cstring>

namespace {

namespace fs = std::filesystem;

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

TEST(FileSystemTest, DoesNotHangOnADeadServer) {
    const std::string point = "/tmp/dead server";
    const platform_test::DeadServer server(point);
    if (!server.IsMounted()) {
        GTEST_SKIP() << "no FUSE";
    }
    fs::create_symlink(point + "/x", "/tmp/to-dead");
    alarm(60);
    for (const std::string &path :
         {point, point + "/a/b", std::string("/tmp/to-dead/y"), point + "/../dead server/x"}) {
        const VORKSHARE share{"share", 0, path.c_str()};
        int inSnapshot = -9;
        int readOnly = -9;
        EXPECT_EQ(VORKFSIsRemoteFS(VORKGetFSType(path.c_str(), 0)), 1) << path;
        EXPECT_EQ(VLIBFhsPathInSnapshot(path.c_str(), &inSnapshot) + inSnapshot, 0) << path;
        EXPECT_EQ(VLIBShareIsReadOnlyGet(&share, &readOnly) + readOnly, 0) << path;
        EXPECT_EQ(Encryption(path.c_str()), "plain") << path;
        EXPECT_EQ(VORKQuotaIsEnough(0, path.c_str(), 1), 0) << path;
        EXPECT_EQ(VLIBCErrGet(), VORK_ERR_IO) << path;
    }
    EXPECT_EQ(VORKFSDirIsMntPoint(point.c_str()), 1);
    EXPECT_EQ(VORKFSDirIsMntPoint((point + "/a").c_str()), 0);
    EXPECT_EQ(VORKFSIsRemoteFS(VORKGetFSType((point + "/../..").c_str(), 0)), 0);
    alarm(0);
}

TEST(FileSystemTest, KnowsEncryptedDirectories) {
    ASSERT_EQ(
        platform_test::Shell("truncate -s 16M /vol2/crypt.img && mkfs.ext4 -q -F -O encrypt /vol2/crypt.img &&"
                             " mkdir /tmp/crypt && mount -n -o loop /vol2/crypt.img /tmp/crypt &&"
                             " mkdir /tmp/crypt/secret /tmp/crypt/open"),
        0);
    const int volume = open("/tmp/crypt", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    const int secret = open("/tmp/crypt/secret", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
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

    EXPECT_EQ(Encryption("/tmp/crypt/secret"), "unlocked");
    EXPECT_EQ(Encryption("/tmp/crypt/open"), "plain");
    EXPECT_EQ(Encryption("/vol1"), "plain");
    EXPECT_EQ(Encryption("/tmp/crypt/missing"), "failed");

    fscrypt_remove_key_arg removal{};
    removal.key_spec = key->key_spec;
    ASSERT_EQ(ioctl(volume, FS_IOC_REMOVE_ENCRYPTION_KEY, &removal), 0) << std::strerror(errno);
    EXPECT_EQ(Encryption("/tmp/crypt/secret"), "locked");
    close(volume);
}

}  // namespace
