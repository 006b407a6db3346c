// How far indexing has got, by queues in trouble.
#include "fixture.h"

#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <limits>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

std::string EventLine(const std::string &path) {
    return R"({"event":2,"path":")" + path + "\"}\n";
}

class Progress : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        fs::create_directories("/vol1/photo/a");
        GivenFolderConf(R"({"/photo/a":{}})");
    }
};

TEST_F(Progress, IsNotSeenInWhatIsNoLineOrNoFile) {
    GivenQueue(std::string(2 << 20, 'x') + "\n" + EventLine("/vol1/photo/a"));
    EXPECT_EQ("processing", Ask("GetFolderStatus /photo/a"));
    EXPECT_EQ(1U, SyslogCapture::Records().size());
    Forget();
    fs::remove(kQueue);
    fs::create_directory(kQueue);
    EXPECT_EQ("finished", Ask("GetStatus"));
}

TEST_F(Progress, CountsALineOnlyWhenItIsWhole) {
    for (const char *data :
         {"", R"("data":null,)", R"("data":{"audio":true,"document":false,"photo":true,"video":true},)"}) {
        const std::string line =
            std::string("{") + data + R"("event":256,"path":"/vol1/photo/a","path_old":"/vol1/photo/b"})";
        for (size_t size = 1; size <= line.size(); ++size) {
            GivenQueue(line.substr(0, size));
            EXPECT_EQ(size == line.size() ? "processing" : "finished", StatusMgr::GetFolderStatus("/photo/a"))
                << size;
            Forget();
        }
    }
}

TEST_F(Progress, IsSeenBehindHolesOfAnySize) {
    const std::string line = EventLine("/vol1/photo/a");
    const off_t last = std::numeric_limits<off_t>::max() - static_cast<off_t>(line.size());
    for (const off_t offset : {off_t{100}, off_t{1} << 16, off_t{1} << 30, off_t{1} << 40, last}) {
        GivenQueue(EventLine("/vol1/photo/b") + "torn");
        ASSERT_EQ(0, ::truncate(kQueue, offset - 1));
        EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
        {
            std::ofstream file(kQueue, std::ios::in | std::ios::out);
            ASSERT_TRUE(file.seekp(offset - 1) << "\n" << line << std::flush) << offset;
        }
        Forget();
        EXPECT_EQ("processing", StatusMgr::GetFolderStatus("/photo/a")) << offset;
        ASSERT_LT(Script::Current().Calls("pread"), 10) << offset;
        EXPECT_EQ("0 status_mgr.cpp:47 Malformed command: torn", Left());
        EXPECT_TRUE(AddCustomEvent(1, "/vol1/photo/a", Json::Value()));
    }
}

TEST_F(Progress, SeesAQueueThatIsReadWithTroubleAsFarAsItGoes) {
    GivenQueue(EventLine("/vol1/photo/a"));
    Fail({.call = "pread", .about = kQueue, .error = EINTR});
    EXPECT_EQ("processing", StatusMgr::GetFolderStatus("/photo/a"));
    Fail({.call = "pread", .about = kQueue, .error = EIO});
    EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
    Fail({.call = "openat", .about = kQueue, .action = [] { fs::remove(kQueue), fs::create_directory(kQueue); }});
    EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
    EXPECT_EQ(std::string("0 status_mgr.cpp:37 Failed to open queue=") + kQueue + ", reason=Invalid argument",
              Left());
    fs::remove(kQueue);
    GivenQueue(EventLine("/vol1/photo/a"));
    fs::rename("/vol1/photo/@eaDir", "/vol1/photo/elsewhere");
    fs::create_directory_symlink("elsewhere", "/vol1/photo/@eaDir");
    EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
    EXPECT_EQ(std::string("0 status_mgr.cpp:37 Failed to open queue=") + kQueue + ", reason=Not a directory",
              Left());
}

}  // namespace
}  // namespace fileindex_test
