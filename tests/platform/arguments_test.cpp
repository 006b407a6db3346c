// What callers hand in, when platform.conf is read, and whose the error code is; the answers themselves are in the
// transcripts.
#include "machine.h"

#include <vork/error.h>
#include <vork/metadata.h>
#include <vork/process.h>
#include <vork/quota.h>
#include <vork/service.h>
#include <vork/share.h>
#include <vorknotifyd/monitor_queue.h>

#include <gtest/gtest.h>

#include <sys/inotify.h>

#include <thread>

using namespace machine;  // NOLINT(google-build-using-namespace): the tools of every test

namespace {

void Configure(const std::string &shares) {
    WriteFile(kPlatformConf, "{\"shares\": {" + shares + "}}");
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

TEST(ArgumentsTest, FillBuffersThatAreLongEnough) {
    Configure(R"("photo": {"path": "/vol1/photo"})");
    const struct {
        int nameSize, pathSize;
        bool fits;
    } rows[] = {{6, 12, true}, {5, 12, false}, {6, 11, false}, {0, 12, false}, {-1, 12, false}, {6, -1, false}};
    for (const auto &row : rows) {
        std::string name(16, '#');
        std::string path(16, '#');
        const int result =
            VORKShareNamePathGet("/vol1/photo/x", name.data(), row.nameSize, path.data(), row.pathSize);
        EXPECT_EQ(result == 0, row.fits) << row.nameSize << " " << row.pathSize;
        EXPECT_EQ(name[row.fits ? 6 : 15], '#') << "written beyond its end";
        EXPECT_EQ(path[row.fits ? 12 : 15], '#') << "written beyond its end";
    }
}

TEST(ArgumentsTest, AreRefusedWhenTheyAreNull) {
    VORKSHARE *share = nullptr;
    char buffer[8];
    const char *const none[] = {nullptr};
    const char *const argv[] = {"true", nullptr};
    const int results[] = {VORKShareGet(nullptr, &share),
                           VORKShareGet("photo", nullptr),
                           VORKShareNamePathGet(nullptr, buffer, 8, buffer, 8),
                           VORKShareNamePathGet("/vol1", nullptr, 8, buffer, 8),
                           VORKEAMKDir(0, nullptr),
                           VLIBServiceStop(nullptr, 1),
                           VLIBCExec(nullptr, nullptr, nullptr, nullptr, nullptr),
                           VLIBCExecv("/bin/true", nullptr, 0, 0),
                           VLIBCExecv("/bin/true", none, 0, 0),
                           VLIBCExecv("/bin/true", argv, 0, 1)};
    for (const int &result : results) {
        EXPECT_LT(result, 0) << &result - results;
    }
    EXPECT_EQ(VORKQuotaIsEnough(0, nullptr, 0), 0);
    EXPECT_EQ(VLIBCErrGet(), VORK_ERR_BAD_PARAMETER);
    EXPECT_EQ(VORKShareIsShareRecycle(nullptr), 0);
    EXPECT_EQ(VORKEAIsHiddenDir(nullptr), 0);
    VORKShareFree(nullptr);
}

TEST(ArgumentsTest, OfAnotherKindOfRegistrationAreRefused) {
    using namespace VORKNOTIFYD;  // NOLINT(google-build-using-namespace)
    EXPECT_FALSE(MonitorQueue::Upsert(MonitorQueue(*Parse(R"({"queue": "/q", "config": []})")), "x",
                                      MONITOR_QUEUE_TYPE_NONE));
    EXPECT_FALSE(MonitorQueue::Delete("/q", "fileindex", MONITOR_QUEUE_TYPE_NONE));
}

TEST(ErrorsTest, BelongToTheThread) {
    VLIBCErrSetEx(0x2900, "here.cpp", 7);
    std::thread([] {
        EXPECT_EQ(VLIBCErrGet(), 0);
        EXPECT_STREQ(VLIBCErrorGetFile(), "");
        EXPECT_EQ(VLIBCErrorGetLine(), 0);
        VLIBCErrSetEx(1, nullptr, 2);
        EXPECT_STREQ(VLIBCErrorGetFile(), "");
    }).join();
    EXPECT_EQ(VLIBCErrGet(), 0x2900);
    EXPECT_STREQ(VLIBCErrorGetFile(), "here.cpp");
    EXPECT_EQ(VLIBCErrorGetLine(), 7);
    VLIBCExecv(nullptr, nullptr, 0, 0);
    EXPECT_STREQ(VLIBCErrorGetFile(), "processes.cpp") << "without its directory";
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
    ASSERT_GE(inotify_add_watch(opened, kPlatformConf, IN_OPEN), 0);
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
