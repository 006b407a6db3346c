// Removing indexed folders, and asking for paths to be indexed again.
#include "fixture.h"

#include <cerrno>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr char kAllChange[] = R"({"audio":true,"document":true,"photo":true,"video":true})";

class IndexDelete : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        GivenFolders({FolderRecord("/music/a", "", "a"), FolderRecord("/photo/a", "", "d"),
                      FolderRecord("/photo/b", "", "p")});
        Platform::Current().searchOn = true;
        daemon_.Start();
    }
    static bool Delete(const std::string &request) { return IndexMgr::Delete(Parse(request)); }
};

TEST_F(IndexDelete, OfNothingWhenNothingIsLeftStopsTheDaemon) {
    GivenFolderConf("{}");
    Platform::Current().searchOn = false;
    EXPECT_TRUE(Delete("[]"));
    EXPECT_THAT(Journal(),
                ElementsAre("lock folder exclusive", "saved folder.conf", "stop fileindexd 1", "unlock folder"))
        << "the search setting is off already";
}

TEST_F(IndexDelete, OfAPathThatIsNotIndexedGoesThroughAllSteps) {
    EXPECT_TRUE(Delete(R"(["/photo/none"])"));
    EXPECT_THAT(SentCommands(),
                ElementsAre(R"({"data":{"folder_path":"/photo/none"},"type":"delete_folder_setting"})"));
    EXPECT_THAT(Queue("photo"), ElementsAre(std::string(R"({"data":{"/photo/none":)") + kAllChange +
                                            R"(},"event":131072,"path":"/vol1/photo/none"})"));
    EXPECT_EQ(3U, Parse(FolderConf()).size());
    EXPECT_EQ(1, Script::Current().Calls("MonitorQueue::Upsert"));
}

TEST_F(IndexDelete, OfAMalformedRequestChangesNothing) {
    const std::string conf = ReadFile(kFolderConf);
    const struct {
        const char *request, *culprit;
    } rows[] = {{R"("/photo/a")", R"("/photo/a")"},
                {R"({"path":"/photo/a"})", R"({"path":"/photo/a"})"},
                {"null", "null"},
                {R"(["/photo/a",5])", "5"},
                {R"(["/photo/a",null])", "null"},
                {R"([["/photo/a"]])", R"(["/photo/a"])"}};
    for (const auto &row : rows) {
        Forget();
        EXPECT_FALSE(Delete(row.request));
        EXPECT_EQ(std::string("1 index_mgr.cpp:61 Bad param: ") + row.culprit, Left());
        EXPECT_EQ(conf, ReadFile(kFolderConf));
        EXPECT_THAT(Journal(), testing::Not(testing::Contains("saved folder.conf")));
        EXPECT_FALSE(IsLocked(kFolderLock));
    }
}

/// Done when the last event is written: after the commands and before the shares are gone through.
std::function<void()> AfterTheEvents(const std::function<void()> &action) {
    return
        [action] { Script::Current().Fail({.call = "write", .about = "/vol1/photo/@eaDir", .action = action}); };
}

TEST_F(IndexDelete, NeverCleansAShareThatTheSavedListStillHolds) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb");
    AfterTheEvents([] { Fail({.call = "open", .about = kFolderConf, .times = kAlways, .error = EIO}); })();
    EXPECT_FALSE(Delete(R"(["/photo/a"])"));
    EXPECT_TRUE(fs::exists("/vol1/photo/@eaDir/VORK@.fileindexdb"));
    EXPECT_EQ(1U, Queue("photo").size());
    EXPECT_EQ(0, Script::Current().Calls("VLIBCExec"));
    EXPECT_EQ(0, Script::Current().Calls("MonitorQueue::Delete"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:121 UpsertVorkNotifydCfg failed, share=photo"));
}

TEST_F(IndexDelete, OfAVanishedShareSavesButCannotQueueItsEvent) {
    Platform::Current().shares.erase("music");
    EXPECT_FALSE(Delete(R"(["/music/a"])"));
    EXPECT_EQ("2 index_mgr.cpp:430 GetFullPath failed, path=/music/a | index_mgr.cpp:111 Update failed", Left());
    EXPECT_EQ(2U, Parse(FolderConf()).size());
    EXPECT_FALSE(Delete(R"([""])"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:79 GetShareNameByPath failed, path="));
}

class IndexReindex : public IndexDelete {
protected:
    static bool Reindex(const std::string &request) { return IndexMgr::Reindex(Parse(request)); }
};

/// The queue's consumer or another writer does something after the first event of a request, before or after the
/// queue has been looked at for the second.
TEST_F(IndexReindex, SeesTheQueueAsItIsAtEachEvent) {
    const std::string queue = "/vol1/photo/@eaDir/VORK@file_index_queue";
    const auto lineOf = [](const std::string &name) {
        return R"({"data":null,"event":65536,"path":"/vol1/photo/)" + name + "\"}";
    };
    const std::string a = lineOf("a");
    const std::string b = lineOf("b");
    const std::string c = lineOf("c");
    const struct {
        const char *name;
        std::function<void()> between;
        std::vector<std::string> lines;
    } rows[] = {
        {"nothing", [] {}, {a, b}},
        {"taken and worked off", [&] { fs::remove(queue); }, {b, a}},
        {"taken", [&] { fs::rename(queue, queue + ".tmp"); }, {b}},
        {"emptied in place", [&] { WriteFile(queue, ""); }, {b, a}},
        {"written anew in place, of the same size", [&] { WriteFile(queue, c + "\n"); }, {c, b, a}},
        {"replaced by a longer one",
         [&] {
             fs::rename(queue, queue + ".old");
             WriteFile(queue, c + "\n" + c + "\n");
         },
         {c, c, b, a}},
        {"appended to", [&] { WriteFile(queue, a + "\n" + c + "\n"); }, {a, c, b}},
    };
    for (const auto &row : rows) {
        for (const int lockCall : {2, 3}) {  // the end of the first lock, the start of the second
            SCOPED_TRACE(row.name);
            fs::remove_all("/vol1/photo/@eaDir");
            Fail({.call = "flock", .about = queue, .nth = lockCall, .action = row.between});
            EXPECT_TRUE(Reindex(R"(["/photo/a","/photo/b","/photo/a","/photo/b"])"));
            EXPECT_EQ(row.lines, Queue("photo")) << lockCall;
            Script::Current().Finish();
        }
    }
}

TEST_F(IndexReindex, ChecksAllPathsBeforeItDoesAnything) {
    GivenStatusConf(R"({"no_space":{"photo":true}})");
    const std::pair<const char *, const char *> rows[] = {
        {R"("/photo/a")", R"(1 index_mgr.cpp:369 Malformed jsArrPath: "/photo/a")"},
        {"{}", "1 index_mgr.cpp:369 Malformed jsArrPath: {}"},
        {R"(["/photo/a",5])", "1 index_mgr.cpp:377 Malformed jsArrPath: 5"},
        {R"(["/photo/a",""])", "0 index_mgr.cpp:384 Failed to get share name from path: "},
        {R"(["/photo/a","/other/x"])", ""},
    };
    for (const auto &[request, left] : rows) {
        EXPECT_FALSE(Reindex(request));
        EXPECT_EQ(left, Left());
        EXPECT_THAT(Journal(), IsEmpty());
    }
    EXPECT_TRUE(Reindex("[]"));
}

}  // namespace
}  // namespace fileindex_test
