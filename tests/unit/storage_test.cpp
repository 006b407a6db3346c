// Where a share's queue and database are, and the registration of its folders with the notification daemon.
#include "fixture.h"

#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <filesystem>
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
    int argumentLine, shareLine, metadataLine;
};

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
    const auto &[name, get, path, outName, argumentLine, shareLine, metadataLine] = GetParam();
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

TEST_P(StorageLocation, OfAnUnknownShareFailsAsThePlatformSays) {
    EXPECT_EQ(-1, Get("none"));
    EXPECT_EQ("0 utils.cpp:" + std::to_string(GetParam().shareLine) + " VORKShareGet failed, name=none, code=5120",
              Left());
    EXPECT_EQ("platform.c", Platform::Current().errorFile) << "the platform's own error stands";
    Fail({.call = "VORKShareGet", .result = 0});
    EXPECT_EQ(-1, Get("photo"));
    EXPECT_EQ('#', buffer_[0]);
}

TEST_P(StorageLocation, IsToldEvenWhenTheMetadataDirectoryCannotBeMade) {
    fs::create_directory("/vol1/photo/@eaDir");
    Fail({.call = "VORKEAMKDir", .error = 0x0800});
    EXPECT_EQ(GetParam().path.size(), Get("photo"));
    EXPECT_EQ(GetParam().path, buffer_.data());
    EXPECT_EQ("0 utils.cpp:" + std::to_string(GetParam().metadataLine) +
                  " VORKEAMKDir failed, path=/vol1/photo/@eaDir, code=2048",
              Left());
}

INSTANTIATE_TEST_SUITE_P(
    Of, StorageLocation,
    testing::Values(Location{"Queue", FILEIDXQueuePathGet, kQueue, "szOutQueuePath", 769, 772, 779},
                    Location{"Database", FILEIDXDBPathGet, kDatabase, "szOutDBPath", 733, 736, 743}),
    [](const auto &info) { return info.param.name; });

class DatabaseLocation : public FileIndexTest {};

TEST_F(DatabaseLocation, IsMadeWithTheUmaskAndToldEvenWhenItCannotBe) {
    GivenShare("photo");
    std::array<char, 4096> buffer{};
    Fail({.call = "mkdir", .about = kDatabase, .error = EACCES});
    EXPECT_EQ(std::string(kDatabase).size(), FILEIDXDBPathGet("photo", buffer.data(), 4096));
    EXPECT_EQ(std::string("0 utils.cpp:750 mkdir failed, path=") + kDatabase + ", reason=Permission denied",
              Left());
    const mode_t before = ::umask(0027);
    EXPECT_EQ(std::string(kDatabase).size(), FILEIDXDBPathGet("photo", buffer.data(), 4096));
    ::umask(before);
    EXPECT_EQ(fs::perms(0750), fs::status(kDatabase).permissions());
}

class Monitor : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("photos");
        GivenShare("empty");
        GivenFolders({FolderRecord("/photo/b", "", "p"), FolderRecord("/photo", "", "d"),
                      FolderRecord("/photos/x", "", "d")});
    }
};

TEST_F(Monitor, IsRegisteredWithAllFoldersOfTheShare) {
    EXPECT_TRUE(IndexMgr::UpsertVorkNotifydCfg("photo"));
    EXPECT_TRUE(IndexMgr::UpsertVorkNotifydCfg("empty"));
    EXPECT_THAT(
        Journal(),
        ElementsAre(R"(monitor fileindex 1 {"config":[)"
                    R"({"ignore":["@eaDir"],"mask":65486,"path":"/vol1/photo"},)"
                    R"({"ignore":["@eaDir"],"mask":65486,"path":"/vol1/photo/b"}],)"
                    R"("queue":"/vol1/photo/@eaDir/VORK@file_index_queue"})",
                    R"(monitor fileindex 1 {"config":[],"queue":"/vol1/empty/@eaDir/VORK@file_index_queue"})"));
    EXPECT_EQ(0, Script::Current().Calls("flock", kFolderLock));
    EXPECT_EQ("", Left());
}

TEST_F(Monitor, IsWithdrawnByItsQueue) {
    GivenFolderConf("{");  // not even read
    EXPECT_TRUE(IndexMgr::DeleteVorkNotifydCfg("photo"));
    EXPECT_THAT(Journal(), ElementsAre(std::string("unmonitor fileindex 1 ") + kQueue));
    EXPECT_EQ("", Left());
}

TEST_F(Monitor, ThatCannotBeChangedIsReported) {
    const std::string none = "0 utils.cpp:772 VORKShareGet failed, name=none, code=5120 | ";
    const auto upsert = IndexMgr::UpsertVorkNotifydCfg;
    const auto withdraw = IndexMgr::DeleteVorkNotifydCfg;
    const struct {
        bool (*change)(const std::string &);
        const char *share;
        Fault fault;
        std::string left;
    } rows[] = {
        {upsert, "none", {.call = "none"}, none + "index_mgr.cpp:286 FILEIDXQueuePathGet failed, share=none"},
        {upsert,
         "photo",
         {.call = "VORKShareGet", .nth = 2, .times = kAlways},
         "2 index_mgr.cpp:297 GetFullPath failed, path=/photo"},
        {upsert, "photo", {.call = "MonitorQueue::Upsert"}, "0 index_mgr.cpp:324 MonitorQueue::Add failed"},
        {upsert, "photo", {.call = "MonitorQueue::Upsert", .result = -2}, ""},  // throws
        {upsert, "photo", {.call = "open", .about = kFolderConf}, kFolderConfUnreadable},
        {withdraw, "none", {.call = "none"}, none + "index_mgr.cpp:344 FILEIDXQueuePathGet failed, share=none"},
        {withdraw, "photo", {.call = "MonitorQueue::Delete"}, "0 index_mgr.cpp:350 MonitorQueue::Delete failed"},
    };
    for (const auto &row : rows) {
        Forget();
        Fail(row.fault);
        EXPECT_FALSE(row.change(row.share));
        EXPECT_EQ(row.left, Left());
        EXPECT_THAT(Journal(), IsEmpty());
        if (row.share == std::string("none")) {
            EXPECT_EQ(0, Script::Current().Calls("open", kFolderConf)) << "fails before the list is read";
        }
        Script::Current().Finish();
    }
}

}  // namespace
}  // namespace fileindex_test
