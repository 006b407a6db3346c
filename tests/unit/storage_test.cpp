// Where a share's queue and database are, and what watches it.
#include "fixture.h"

#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <filesystem>
#include <new>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr char kDatabase[] = "/vol1/photo/@eaDir/VORK@.fileindexdb";

const struct Location {
    int (*get)(const char *, char *, int);
    const char *outName;
    int argumentLine;
} kLocations[] = {{FILEIDXQueuePathGet, "szOutQueuePath", 769}, {FILEIDXDBPathGet, "szOutDBPath", 733}};

class StorageLocation : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        buffer_.fill('#');
    }

    std::array<char, 4096> buffer_{};
};

TEST_F(StorageLocation, IsCutToAShortBufferWhileTheDirectoriesAreMadeWhole) {
    for (const Location &location : kLocations) {
        buffer_.fill('#');
        EXPECT_EQ(9, location.get("photo", buffer_.data(), 10));
        EXPECT_STREQ("/vol1/pho", buffer_.data());
        EXPECT_EQ('#', buffer_[10]);
        EXPECT_EQ(0, location.get("photo", buffer_.data(), 1));
        EXPECT_STREQ("", buffer_.data());
    }
    EXPECT_TRUE(fs::is_directory(kDatabase));
    EXPECT_FALSE(fs::exists("/vol1/pho"));
}

TEST_F(StorageLocation, RefusesBadArgumentsInOrder) {
    for (const auto &[get, outName, argumentLine] : kLocations) {
        const struct {
            const char *share;
            char *out;
            int size;
            std::string condition;
        } rows[] = {
            {nullptr, nullptr, 0, "__null != szName"},
            {"photo", nullptr, 0, std::string("__null != ") + outName},
            {"photo", buffer_.data(), 0, "cbOutLen > 0"},
            {"photo", buffer_.data(), -1, "cbOutLen > 0"},
        };
        for (const auto &row : rows) {
            const std::string line = std::to_string(argumentLine);
            Platform &platform = Platform::Current();
            platform.errorCode = 0;
            EXPECT_EQ(-1, get(row.share, row.out, row.size));
            EXPECT_EQ("0 utils.cpp:" + line + " Invaild Argument (" + row.condition + ")=[0]\n", Left());
            EXPECT_EQ(0x0D00, platform.errorCode);
            EXPECT_EQ("utils.cpp " + line, platform.errorFile + " " + std::to_string(platform.errorLine));
        }
    }
    EXPECT_EQ('#', buffer_[0]);
    EXPECT_FALSE(fs::exists("/vol1/photo/@eaDir"));
}

TEST_F(StorageLocation, OfTheDatabaseIsMadeWithTheUmaskAndToldEvenWhenItCannotBe) {
    Fail({.call = "mkdirat", .about = kDatabase, .error = EACCES});
    EXPECT_EQ(std::string(kDatabase).size(), FILEIDXDBPathGet("photo", buffer_.data(), 4096));
    EXPECT_EQ(std::string("0 utils.cpp:750 mkdir failed, path=") + kDatabase + ", reason=Permission denied",
              Left());
    const auto held = [] { EXPECT_EQ(1, Platform::Current().shareRecords) << "given back last"; };
    Fail({.call = "mkdirat", .about = kDatabase, .action = held});
    ::umask(0027);
    EXPECT_EQ(std::string(kDatabase).size(), FILEIDXDBPathGet("photo", buffer_.data(), 4096));
    EXPECT_EQ(fs::perms(0750), fs::status(kDatabase).permissions());
}

TEST_F(StorageLocation, CleaningRemovesTheIndexDataAndNothingElse) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb/deep/er");
    WriteFile("/vol1/photo/@eaDir/other", "kept");
    GivenQueue("x", ".tmp");
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo"));
    EXPECT_EQ("kept", ReadFile("/vol1/photo/@eaDir/other"));
    Fail({.call = "VLIBCExec", .times = 3, .result = 1});
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo")) << "what rm says does not count";
}

TEST_F(StorageLocation, BehindALinkIsToldButNotMade) {
    fs::create_directory("/vol1/photo/elsewhere");
    fs::create_directory_symlink("elsewhere", "/vol1/photo/@eaDir");
    EXPECT_EQ(std::string(kDatabase).size(), FILEIDXDBPathGet("photo", buffer_.data(), 4096));
    const std::string notMade =
        std::string("0 utils.cpp:750 mkdir failed, path=") + kDatabase + ", reason=Not a directory";
    EXPECT_EQ(notMade, Left());
    EXPECT_TRUE(fs::is_empty("/vol1/photo/elsewhere"));
    EXPECT_EQ("yes " + notMade, AskAlone("CleanShareIndexData photo")) << "the platform follows no link either";
    EXPECT_EQ(3, Script::Current().Calls("VLIBCExec"));
}

TEST_F(StorageLocation, CleaningStopsAtAPathThatIsCut) {
    bool cleaned = true;
    for (size_t length = 4050; length < 4096; ++length) {
        Platform::Current().shares["long"].path = "/" + std::string(length, 'x');
        cleaned = IndexMgr::CleanShareIndexData("long");
    }
    EXPECT_FALSE(cleaned);
}

TEST_F(StorageLocation, OfAMonitorWithoutMemoryForItIsReported) {
    delete new (std::nothrow) char;
    if (Script::Current().Calls("new") == 0) {
        GTEST_SKIP() << "a memory checker allocates instead";
    }
    Fail({.call = "new"});
    EXPECT_FALSE(IndexMgr::UpsertVorkNotifydCfg("photo"));
    EXPECT_EQ(R"(0 index_mgr.cpp:317 Failed to create MonitorQueue, jsQueue={"config":[],"queue":")" +
                  std::string(kQueue) + "\"}",
              Left());
}

}  // namespace
}  // namespace fileindex_test
