// What callers hand in to be filled, and when platform.conf is read; the answers themselves are in the
// transcripts.
#include "support.h"

#include <vork/filesystem.h>
#include <vork/metadata.h>
#include <vork/quota.h>
#include <vork/service.h>
#include <vork/share.h>

#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/xattr.h>

#include <cstring>

namespace {

using platform_test::kConfiguration;

void Configure(const std::string &shares) {
    platform_test::WriteFile(kConfiguration, "{\"shares\": {" + shares + "}}");
}

std::string PathOf(const std::string &name) {
    VORKSHARE *share = nullptr;
    if (VORKShareGet(name.c_str(), &share) < 0) {
        return "none";
    }
    std::string path = share->szPath;
    VORKShareFree(share);
    return path;
}

TEST(SharesTest, FillsBuffersThatAreLongEnough) {
    Configure(R"("photo": {"path": "/vol1/photo"})");
    const struct {
        int nameSize, pathSize;
        bool fits;
    } rows[] = {{6, 12, true}, {5, 12, false}, {6, 11, false}, {0, 12, false}, {-1, 12, false}, {6, -1, false}};
    for (const auto &row : rows) {
        char name[16];
        char path[16];
        std::memset(name, '#', sizeof name);
        std::memset(path, '#', sizeof path);
        const int result = VORKShareNamePathGet("/vol1/photo/x", name, row.nameSize, path, row.pathSize);
        EXPECT_EQ(result == 0, row.fits) << row.nameSize << " " << row.pathSize;
        EXPECT_EQ(name[row.fits ? 6 : 15], '#') << "written beyond its end";
        EXPECT_EQ(path[row.fits ? 12 : 15], '#') << "written beyond its end";
    }
}

TEST(SharesTest, RefusesNullArguments) {
    VORKSHARE *share = nullptr;
    char buffer[8];
    EXPECT_LT(VORKShareGet(nullptr, &share), 0);
    EXPECT_LT(VORKShareGet("photo", nullptr), 0);
    EXPECT_LT(VORKShareNamePathGet(nullptr, buffer, 8, buffer, 8), 0);
    EXPECT_LT(VORKShareNamePathGet("/vol1", nullptr, 8, buffer, 8), 0);
    EXPECT_EQ(VORKShareIsShareRecycle(nullptr), 0);
    VORKShareFree(nullptr);
    EXPECT_EQ(VORKEAIsHiddenDir(nullptr), 0);
    EXPECT_LT(VORKEAMKDir(0, nullptr), 0);
    EXPECT_LT(VLIBServiceStop(nullptr, 1), 0);
    EXPECT_EQ(VORKQuotaIsEnough(0, nullptr, 0), 0);
    EXPECT_EQ(VLIBCErrGet(), VORK_ERR_BAD_PARAMETER);
}

// A default access list of the share would let its users write into directories made in the metadata directory:
// with one, the mode that the system gives them is not cut by the umask.
TEST(SharesTest, HandDownNoAccessListToTheServices) {
    struct Entry {
        uint16_t tag, permissions;
        uint32_t id;
    };
    const struct {
        uint32_t version = 2;
        Entry entries[5] = {{0x01, 7, ~0U}, {0x02, 7, 65534}, {0x04, 5, ~0U}, {0x10, 7, ~0U}, {0x20, 5, ~0U}};
    } list;
    ASSERT_EQ(mkdir("/vol1/listed", 0755), 0);
    if (setxattr("/vol1/listed", "system.posix_acl_default", &list, sizeof list, 0) != 0) {
        GTEST_SKIP() << "no access lists here";
    }
    ASSERT_EQ(VORKEAMKDir(0, "/vol1/listed/@eaDir"), 0);
    umask(022);
    ASSERT_EQ(mkdir("/vol1/listed/@eaDir/database", 0777), 0);
    struct stat status {};
    ASSERT_EQ(stat("/vol1/listed/@eaDir/database", &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0755U);
}

// Same size, same inode, times that the clock cannot tell apart: the hardest change to notice.
TEST(SharesTest, SeesEveryChangeAtOnce) {
    for (int i = 100; i < 600; ++i) {
        const std::string path = "/vol" + std::to_string(i) + "/photo";
        Configure(R"("photo": {"path": ")" + path + "\"}");
        ASSERT_EQ(PathOf("photo"), path);
    }
}

TEST(SharesTest, ReadsAnOldFileOnceForAThousandShares) {
    std::string shares = R"("share": {"path": "/vol1/share"})";
    for (int i = 0; i < 1000; ++i) {
        const std::string name = "share" + std::to_string(i);
        shares.append(",\"").append(name).append("\": {\"path\": \"/vol1/").append(name).append("\"}");
    }
    Configure(shares);
    const int opened = inotify_init1(IN_NONBLOCK | IN_CLOEXEC);
    ASSERT_GE(inotify_add_watch(opened, kConfiguration.c_str(), IN_OPEN), 0);
    inotify_event event{};
    // A file just written is read again until its times can be told from the next change's.
    do {
        ASSERT_EQ(PathOf("share"), "/vol1/share");
    } while (read(opened, &event, sizeof event) > 0);
    for (int i = 0; i < 1000; ++i) {
        const std::string name = "share" + std::to_string(i);
        ASSERT_EQ(PathOf(name), "/vol1/" + name);
        ASSERT_EQ(VORKShareIsShareRecycle(("/vol1/" + name + "/#recycle").c_str()), 1);
    }
    EXPECT_LT(read(opened, &event, sizeof event), 0) << "read again";
    close(opened);
}

}  // namespace
