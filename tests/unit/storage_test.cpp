// Where a share's queue and database are, and what watches it.
#include "fixture.h"

#include <array>
#include <cerrno>
#include <filesystem>
#include <new>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

const std::string kDatabase = "/vol1/photo/@eaDir/VORK@.fileindexdb";

class StorageLocation : public FileIndexTest {
protected:
    static std::string NotMade(const std::string &reason) {
        return "utils.cpp:750 mkdir failed, path=" + kDatabase + ", reason=" + reason;
    }
};

TEST_F(StorageLocation, RefusesBadArgumentsInOrderAndCutsToAShortBuffer) {
    const struct {
        int (*get)(const char *, char *, int);
        std::string outName;
        std::string line;
    } functions[] = {{FILEIDXQueuePathGet, "szOutQueuePath", "769"}, {FILEIDXDBPathGet, "szOutDBPath", "733"}};
    for (const auto &[get, outName, line] : functions) {
        std::array<char, 64> buffer{};
        buffer.fill('#');
        const struct {
            const char *share;
            char *out;
            int size;
            std::string condition;
        } rows[] = {
            {nullptr, nullptr, 0, "__null != szName"},
            {"photo", nullptr, 0, "__null != " + outName},
            {"photo", buffer.data(), 0, "cbOutLen > 0"},
            {"photo", buffer.data(), -1, "cbOutLen > 0"},
        };
        Platform &platform = Platform::Current();
        for (const auto &row : rows) {
            platform.errorCode = 0;
            EXPECT_EQ(-1, get(row.share, row.out, row.size));
            EXPECT_EQ("utils.cpp:" + line + " Invaild Argument (" + row.condition + ")=[0]\n", Left());
            EXPECT_EQ(0x0D00, platform.errorCode);
            EXPECT_EQ("utils.cpp " + line, platform.errorFile + " " + std::to_string(platform.errorLine));
        }
        EXPECT_EQ('#', buffer[0]);
        EXPECT_EQ(outName == "szOutDBPath", fs::exists("/vol1/photo/@eaDir")) << "made by the other one";
        EXPECT_EQ(9, get("photo", buffer.data(), 10));
        EXPECT_STREQ("/vol1/pho", buffer.data());
        EXPECT_EQ('#', buffer[10]);
        EXPECT_EQ(0, get("photo", buffer.data(), 1));
        EXPECT_STREQ("", buffer.data());
    }
    EXPECT_TRUE(fs::is_directory(kDatabase)) << "from the whole path";
    EXPECT_FALSE(fs::exists("/vol1/pho"));
}

TEST_F(StorageLocation, OfTheDatabaseIsMadeWithTheUmaskAndToldEvenWhenItCannotBe) {
    Fail({.call = "mkdirat", .about = kDatabase, .error = EACCES});
    EXPECT_EQ(kDatabase + "; " + NotMade("Permission denied"), AskAlone("FILEIDXDBPathGet photo"));
    const auto held = [] { EXPECT_EQ(1, Platform::Current().shareRecords) << "given back last"; };
    Fail({.call = "mkdirat", .about = kDatabase, .action = held});
    ::umask(0027);
    EXPECT_EQ(kDatabase, AskAlone("FILEIDXDBPathGet photo"));
    EXPECT_EQ(0040750U, StatusOf(kDatabase).st_mode);
}

TEST_F(StorageLocation, BehindALinkIsToldButNotMade) {
    Given("directory /vol1/photo/elsewhere");
    Given("link /vol1/photo/@eaDir elsewhere");
    EXPECT_EQ(kDatabase + "; " + NotMade("Not a directory"), AskAlone("FILEIDXDBPathGet photo"));
    EXPECT_TRUE(fs::is_empty("/vol1/photo/elsewhere"));
    EXPECT_EQ("yes; " + NotMade("Not a directory"), AskAlone("CleanShareIndexData photo"))
        << "the platform follows no link either";
    EXPECT_EQ(3, Calls("VLIBCExec"));
}

TEST_F(StorageLocation, CleaningRemovesTheIndexDataAndNothingElse) {
    fs::create_directories(kDatabase + "/deep/er");
    WriteFile("/vol1/photo/@eaDir/other", "kept");
    GivenQueue("x");
    GivenQueue("x", ".tmp");
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo"));
    EXPECT_EQ("kept", ReadFile("/vol1/photo/@eaDir/other"));
    EXPECT_EQ(1, std::distance(fs::directory_iterator("/vol1/photo/@eaDir"), {}));
    Fail({.call = "VLIBCExec", .times = 3, .result = 1});
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo")) << "what rm says does not count";
}

// A path that fills the buffer of 4096 bytes may be cut; the queue's is the longer one of the two.
TEST_F(StorageLocation, CleaningStopsAtAPathThatMayBeCut) {
    const std::string queue = "/@eaDir/VORK@file_index_queue";
    for (size_t length = 4050; length < 4100; ++length) {
        Platform::Current().shares["long"].path = "/" + std::string(length - 1, 'x');
        Forget();
        const bool isWhole = length + queue.size() < 4095;
        EXPECT_EQ(isWhole, IndexMgr::CleanShareIndexData("long")) << length;
        EXPECT_EQ(isWhole ? 3 : 0, Calls("VLIBCExec")) << length;
    }
}

TEST_F(StorageLocation, OfAMonitorWithoutMemoryForItIsReported) {
    delete new (std::nothrow) char;
    if (Calls("new") == 0) {
        GTEST_SKIP() << "a memory checker allocates instead";
    }
    Fail({.call = "new"});
    EXPECT_EQ(R"(no; index_mgr.cpp:317 Failed to create MonitorQueue, jsQueue={"config":[],"queue":")" +
                  std::string(kQueue) + "\"}",
              AskAlone("UpsertVorkNotifydCfg photo"));
}

}  // namespace
}  // namespace fileindex_test
