// Encrypted directories, whose keys no program for a transcript adds; all else about file systems is in those.
#include "support.h"

#include <fcntl.h>
#include <linux/fscrypt.h>
#include <sys/ioctl.h>

#include <cerrno>
#include <cstring>

namespace {

using platform_test::Encryption;

TEST(EncryptionTest, IsUnlockedWhileItsKeyIsThere) {
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
