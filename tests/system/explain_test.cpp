// "fileindexctl explain" on file systems on which exactly one rule fails.
#include "../platform/support.h"

#include <fileindex/indexability.h>

#include <linux/fscrypt.h>
#include <sys/ioctl.h>

#include <cerrno>
#include <cstring>

namespace {

using platform_test::ReadText;
using platform_test::Shell;
using platform_test::WriteFile;

int Explain(const std::string &path, Json::Value &data, const std::string &environment = "") {
    const int status = Shell(environment + " \"$BIN_DIR/fileindexctl\" explain --json '" + path +
                             "' >/tmp/explained 2>/dev/null");
    data = platform_test::Parse(ReadText("/tmp/explained"))["data"];
    return status;
}

class ExplainTest : public testing::Test {
protected:
    void SetUp() override {
        WriteFile(platform_test::kConfiguration, R"({"shares": {
            "photo": {"path": "/vol1/photo", "snapshot": "#snapshot"}, "images": {"path": "/vol1/images"},
            "odd": {"path": "/vol1/even"}, "NetBackup": {"path": "/vol1/NetBackup"},
            "sealed": {"path": "/vol2/sealed"}, "surveillance": {"path": "/vol2/sealed/surveillance"},
            "secret": {"path": "/vol2/crypt/secret"}}})");
        ASSERT_EQ(
            Shell("mkdir -p /vol1/photo/2015 '/vol1/photo/a#recycle' /vol1/photo/#snapshots /vol1/even"
                  " /vol1/NetBackup /vol1/images /vol2/sealed/x /vol2/sealed/surveillance"
                  " /usr/vork/etc/fileindex; cd /vol1/photo && ln -sfn 2015 link && ln -sfn memory to-memory"),
            0);
    }

    void ExpectOnlyFailure(const std::string &path, const std::string &rule) {
        Json::Value data;
        EXPECT_EQ(Explain(path, data), rule.empty() ? 0 : 1) << path;
        std::string failed;
        for (const auto &entry : data["rules"]) {
            failed += entry["result"] == "failed" ? entry["rule"].asString() : "";
        }
        EXPECT_EQ(failed, rule) << path;
        EXPECT_EQ(data["failed_rule"].asString(), rule) << path;
        const std::string taken = data["path"].asString();
        EXPECT_EQ(data["indexable"].asBool(), data["taken_as"] == "full path"
                                                  ? VORK::FILEINDEX::CanFullPathBeIndexed(taken)
                                                  : VORK::FILEINDEX::CanPathBeIndexed(taken))
            << path;
        EXPECT_TRUE(data["explained"].asBool()) << path;
        EXPECT_TRUE(rule.empty() || data["remedy"].isString()) << path;
    }
};

TEST_F(ExplainTest, NamesTheRuleThatFails) {
    ASSERT_EQ(Shell("cd /vol1/photo && mkdir disk proc memory && truncate -s 8M ../images/disk.img &&"
                    " mkfs.ext4 -q -F ../images/disk.img && mount -n -o loop ../images/disk.img disk &&"
                    " mount -n -t proc proc proc && mount -n -t tmpfs none memory &&"
                    " mount -n --bind /vol2/sealed /vol2/sealed && mount -n -o remount,bind,ro /vol2/sealed"),
              0);
    WriteFile("/usr/vork/etc/fileindex/folder.conf",
              R"({"/photo/2015/": {"path": "/photo/2015/", "name": "x", "document": true,
                 "audio": true, "video": true, "photo": true}})");
    const struct {
        const char *path, *rule;
    } rows[] = {
        {"/photo", ""},
        {"/photo/a#recycle", ""},
        {"/photo/#snapshots", ""},
        {"/vol1/photo/2015/", ""},
        {"/nowhere/x", "share_present"},
        {"/odd", "share_present"},
        {"/photo/#recycle/x", "recycle_bin"},
        {"/vol1/photo/#snapshot/daily", "snapshot"},
        {"/photo/missing", "known_file_system"},
        {"/photo/disk", "image"},
        {"/photo/proc/1", "pseudo_file_system"},
        {"/vol1/even", "in_share"},
        {"/", "in_share"},
        {"/NetBackup", "share_name"},
        {"/sealed/x", "share_writable"},
        {"/photo/memory", "mount_point"},
        {"/photo/link", "real_path"},
        {"/vol1/photo/./2015", "real_path"},
        {"/photo/2015/", "real_path"},  // indexed under this name
        // Of several that fail, the first in the library's order.
        {"/photo/#recycle/../missing", "recycle_bin"},
        {"/surveillance", "share_name"},
        {"/photo/to-memory", "mount_point"},
    };
    for (const auto &row : rows) {
        ExpectOnlyFailure(row.path, row.rule);
    }
}

// The server never answers, so this also tells that nothing below its mount is looked at.
TEST_F(ExplainTest, NamesANetworkFileSystem) {
    const platform_test::DeadServer server("/vol1/photo/net");
    if (!server.IsMounted()) {
        GTEST_SKIP() << "no FUSE";
    }
    ASSERT_EQ(Shell("ln -s net/x /vol1/photo/to-net"), 0);
    for (const char *path : {"/photo/net", "/photo/net/a/b", "/vol1/photo/to-net/y"}) {
        ExpectOnlyFailure(path, "local_file_system");
    }
}

TEST_F(ExplainTest, NamesALockedShare) {
    ASSERT_EQ(Shell("cd /vol2 && truncate -s 16M crypt.img && mkfs.ext4 -q -F -O encrypt crypt.img &&"
                    " mkdir crypt && mount -n -o loop crypt.img crypt && mkdir crypt/secret"),
              0);
    const int secret = open("/vol2/crypt/secret", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    fscrypt_policy_v1 policy{};  // its key is never added
    policy.contents_encryption_mode = FSCRYPT_MODE_AES_256_XTS;
    policy.filenames_encryption_mode = FSCRYPT_MODE_AES_256_CTS;
    const int result = ioctl(secret, FS_IOC_SET_ENCRYPTION_POLICY, &policy);
    close(secret);
    if (result != 0) {
        GTEST_SKIP() << "the kernel does not encrypt directories: " << std::strerror(errno);
    }
    ExpectOnlyFailure("/secret", "share_unlocked");
}

// The library sees another answer of the platform than the rules do.
TEST_F(ExplainTest, GivesNoReasonThatTheLibraryDoesNotHave) {
    const char *sanitize = std::getenv("SANITIZE");
    if (sanitize == nullptr || *sanitize != '\0') {
        GTEST_SKIP() << "a sanitizer has to be loaded first";
    }
    WriteFile("/tmp/fickle.c",
              "int VLIBShareIsReadOnlyGet(const void *share, int *readOnly)"
              " { static int calls; *readOnly = calls++ % 3 == 0; return share == 0; }");
    ASSERT_EQ(Shell("\"$CC\" -shared -fPIC -o /tmp/fickle.so /tmp/fickle.c"), 0);
    Json::Value data;
    EXPECT_EQ(Explain("/photo", data, "LD_PRELOAD=/tmp/fickle.so"), 1);
    EXPECT_FALSE(data["indexable"].asBool());
    EXPECT_FALSE(data["explained"].asBool());
    EXPECT_TRUE(data["failed_rule"].isNull());
}

}  // namespace
