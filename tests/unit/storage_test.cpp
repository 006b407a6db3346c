// Where a share's queue and database are, and what watches it.
#include "fixture.h"

#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <filesystem>
#include <new>
#include <ostream>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr char kQueue[] = "/vol1/photo/@eaDir/VORK@file_index_queue";
constexpr char kDatabase[] = "/vol1/photo/@eaDir/VORK@.fileindexdb";

struct Location {
    const char *name;
    int (*get)(const char *, char *, int);
    std::string path;
    const char *outName;
    int argumentLine;
};

void PrintTo(const Location &location, std::ostream *out) {
    *out << location.name;
}

class StorageLocation : public FileIndexTest, public testing::WithParamInterface<Location> {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        buffer_.fill('#');
    }
    int Get(const char *share, int size = 4096) { return GetParam().get(share, buffer_.data(), size); }

    std::array<char, 4096> buffer_{};
};

TEST_P(StorageLocation, LiesInTheMetadataDirectoryThatIsMadeForIt) {
    EXPECT_EQ(GetParam().path.size(), Get("photo"));
    EXPECT_EQ(GetParam().path, buffer_.data());
    EXPECT_TRUE(fs::is_directory("/vol1/photo/@eaDir"));
    EXPECT_FALSE(fs::exists(kQueue)) << "the queue file is made by its writers";
    EXPECT_EQ(GetParam().path == kDatabase, fs::is_directory(kDatabase));
    EXPECT_EQ(GetParam().path.size(), Get("photo")) << "again, with all there";
    EXPECT_EQ("", Left());
}

TEST_P(StorageLocation, IsCutToAShortBufferWhileTheDirectoriesAreMadeWhole) {
    EXPECT_EQ(9, Get("photo", 10));
    EXPECT_STREQ("/vol1/pho", buffer_.data());
    EXPECT_EQ('#', buffer_[10]);
    EXPECT_EQ(0, Get("photo", 1));
    EXPECT_STREQ("", buffer_.data());
    EXPECT_EQ(GetParam().path == kDatabase, fs::is_directory(kDatabase));
    EXPECT_FALSE(fs::exists("/vol1/pho"));
}

TEST_P(StorageLocation, RefusesBadArgumentsInOrder) {
    const auto &[name, get, path, outName, argumentLine] = GetParam();
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
        Platform::Current().errorCode = 0;
        EXPECT_EQ(-1, get(row.share, row.out, row.size));
        EXPECT_EQ(
            "0 utils.cpp:" + std::to_string(argumentLine) + " Invaild Argument (" + row.condition + ")=[0]\n",
            Left());
        EXPECT_EQ(0x0D00, Platform::Current().errorCode);
        EXPECT_EQ("utils.cpp", Platform::Current().errorFile);
        EXPECT_EQ(argumentLine, Platform::Current().errorLine);
    }
    EXPECT_EQ('#', buffer_[0]);
    EXPECT_FALSE(fs::exists("/vol1/photo/@eaDir"));
}

INSTANTIATE_TEST_SUITE_P(Of, StorageLocation,
                         testing::Values(Location{"Queue", FILEIDXQueuePathGet, kQueue, "szOutQueuePath", 769},
                                         Location{"Database", FILEIDXDBPathGet, kDatabase, "szOutDBPath", 733}),
                         [](const auto &info) { return info.param.name; });

class DatabaseLocation : public FileIndexTest {};

TEST_F(DatabaseLocation, IsMadeWithTheUmaskAndToldEvenWhenItCannotBe) {
    GivenShare("photo");
    std::array<char, 4096> buffer{};
    Fail({.call = "mkdir", .about = kDatabase, .error = EACCES});
    EXPECT_EQ(std::string(kDatabase).size(), FILEIDXDBPathGet("photo", buffer.data(), 4096));
    EXPECT_EQ(std::string("0 utils.cpp:750 mkdir failed, path=") + kDatabase + ", reason=Permission denied",
              Left());
    const auto held = [] { EXPECT_EQ(1, Platform::Current().shareRecords) << "given back last"; };
    Fail({.call = "mkdir", .about = kDatabase, .action = held});
    const mode_t before = ::umask(0027);
    EXPECT_EQ(std::string(kDatabase).size(), FILEIDXDBPathGet("photo", buffer.data(), 4096));
    ::umask(before);
    EXPECT_EQ(fs::perms(0750), fs::status(kDatabase).permissions());
}

class IndexData : public FileIndexTest {};

TEST_F(IndexData, CleaningRemovesTheIndexDataAndNothingElse) {
    GivenShare("photo");
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb/deep/er");
    WriteFile("/vol1/photo/@eaDir/other", "kept");
    GivenQueue("photo", "x", ".tmp");
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo"));
    EXPECT_EQ("kept", ReadFile("/vol1/photo/@eaDir/other"));
    Fail({.call = "VLIBCExec", .times = 3, .result = 1});
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo")) << "what rm says does not count";
}

TEST_F(IndexData, CleaningStopsAtAPathThatIsCut) {
    bool cleaned = true;
    for (size_t length = 4050; length < 4096; ++length) {
        Platform::Current().shares["long"].path = "/" + std::string(length, 'x');
        cleaned = IndexMgr::CleanShareIndexData("long");
    }
    EXPECT_FALSE(cleaned);
}

class Monitor : public FileIndexTest {};

TEST_F(Monitor, WithoutMemoryForItIsReported) {
    delete new (std::nothrow) char;
    if (Script::Current().Calls("new") == 0) {
        GTEST_SKIP() << "a memory checker allocates instead";
    }
    GivenShare("photo");
    Fail({.call = "new"});
    EXPECT_FALSE(IndexMgr::UpsertVorkNotifydCfg("photo"));
    EXPECT_EQ(R"(0 index_mgr.cpp:317 Failed to create MonitorQueue, jsQueue={"config":[],"queue":")" +
                  std::string(kQueue) + "\"}",
              Left());
}

}  // namespace
}  // namespace fileindex_test
