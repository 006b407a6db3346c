// "fileindexctl explain" on file systems on which exactly one rule fails.
#include "../platform/support.h"

#include <fileindex/indexability.h>

#include <json/reader.h>
#include <json/value.h>

#include <fcntl.h>
#include <linux/fscrypt.h>
#include <sys/ioctl.h>

#include <cstring>
#include <sstream>

namespace {

using platform_test::ReadText;
using platform_test::Shell;
using platform_test::WriteFile;

int Explain(const std::string &path, Json::Value &data, const std::string &environment = "") {
    const int status = Shell(environment + " \"$BIN_DIR/fileindexctl\" explain --json '" + path +
                             "' >/tmp/explained 2>/dev/null");
    std::istringstream text(ReadText("/tmp/explained"));
    Json::Value document;
    text >> document;
    data = document["data"];
    return status;
}

bool LibraryAllows(const Json::Value &data) {
    const std::string path = data["path"].asString();
    return data["taken_as"] == "full path" ? VORK::FILEINDEX::CanFullPathBeIndexed(path)
                                           : VORK::FILEINDEX::CanPathBeIndexed(path);
}

class ExplainTest : public testing::Test {
protected:
    void SetUp() override {
        WriteFile(platform_test::kConfiguration, R"({"shares": {
            "photo": {"path": "/vol1/photo", "snapshot": "#snapshot"}, "images": {"path": "/vol1/images"},
            "odd": {"path": "/vol1/even"}, "NetBackup": {"path": "/vol1/NetBackup"},
            "sealed": {"path": "/mnt/sealed"}, "surveillance": {"path": "/mnt/sealed/surveillance"},
            "secret": {"path": "/mnt/crypt/secret"}}})");
        ASSERT_EQ(
            Shell("mkdir -p /vol1/photo/2015 '/vol1/photo/a#recycle' /vol1/photo/#snapshots /vol1/even"
                  " /vol1/NetBackup /mnt/sealed/x /mnt/sealed/surveillance /vol1/photo/net"
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
        EXPECT_EQ(data["indexable"].asBool(), LibraryAllows(data)) << path;
        EXPECT_TRUE(data["explained"].asBool()) << path;
        EXPECT_TRUE(rule.empty() || data["remedy"].isString()) << path;
    }

    platform_test::Mounts mounts_;
};

TEST_F(ExplainTest, NamesTheRuleThatFails) {
    ASSERT_TRUE(mounts_.MountImage("/vol1/images/disk.img", 8, "mkfs.ext4 -q -F $IMAGE", "/vol1/photo/disk"));
    ASSERT_TRUE(mounts_.Mount("proc", "/vol1/photo/proc", "-t proc"));
    ASSERT_TRUE(mounts_.Mount("none", "/vol1/photo/memory", "-t tmpfs"));
    ASSERT_TRUE(mounts_.Mount("/mnt/sealed", "/mnt/sealed", "--bind"));
    ASSERT_EQ(Shell("mount -n -o remount,bind,ro /mnt/sealed"), 0);
    WriteFile("/usr/vork/etc/fileindex/folder.conf",
              R"({"/photo/2015/": {"path": "/photo/2015/", "name": "x", "document": true,
                 "audio": true, "video": true, "photo": true}})");
    const struct {
        const char *path;
        const char *rule;
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
    const int server = open("/dev/fuse", O_RDWR | O_CLOEXEC);
    if (server < 0) {
        GTEST_SKIP() << "no /dev/fuse";
    }
    const std::string options = "fd=" + std::to_string(server) + ",rootmode=40000,user_id=0,group_id=0";
    ASSERT_EQ(mount("server:/", "/vol1/photo/net", "fuse.sshfs", 0, options.c_str()), 0) << std::strerror(errno);
    ASSERT_EQ(Shell("ln -s net/x /vol1/photo/to-net"), 0);
    for (const char *path : {"/photo/net", "/photo/net/a/b", "/vol1/photo/to-net/y"}) {
        ExpectOnlyFailure(path, "local_file_system");
    }
    close(server);
    umount2("/vol1/photo/net", MNT_DETACH);
}

TEST_F(ExplainTest, NamesALockedShare) {
    ASSERT_TRUE(mounts_.MountImage("/vol2/crypt.img", 16, "mkfs.ext4 -q -F -O encrypt $IMAGE", "/mnt/crypt"));
    std::filesystem::create_directories("/mnt/crypt/secret");
    const int secret = open("/mnt/crypt/secret", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
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
