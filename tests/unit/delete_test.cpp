// Removing indexed folders, and asking for paths to be indexed again.
#include "fixture.h"

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

class IndexChange : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        GivenFolderConf(R"({"/music/a":{},"/photo/a":{},"/photo/b":{}})");
        daemon_.Start();
    }
};

TEST_F(IndexChange, NeverCleansAShareThatTheSavedListStillHolds) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb");
    // Once the last event is written, before the shares are gone through.
    const auto loseTheList = [] { Fail({.call = "open", .about = kFolderConf, .times = kAlways}); };
    Fail({.call = "write", .about = "/vol1/photo/@eaDir", .action = loseTheList});
    EXPECT_FALSE(IndexMgr::Delete(Parse(R"(["/photo/a"])")));
    EXPECT_TRUE(fs::exists("/vol1/photo/@eaDir/VORK@.fileindexdb"));
    EXPECT_EQ(1U, Queue().size());
    EXPECT_EQ(0, Script::Current().Calls("VLIBCExec"));
    EXPECT_EQ(0, Script::Current().Calls("MonitorQueue::Delete"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:121 UpsertVorkNotifydCfg failed, share=photo"));
}

/// The queue's consumer or another writer does something after the first event of a request, before or after the
/// queue has been looked at for the second.
TEST_F(IndexChange, ReindexSeesTheQueueAsItIsAtEachEvent) {
    const std::string queue = kQueue;
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
            EXPECT_TRUE(IndexMgr::Reindex(Parse(R"(["/photo/a","/photo/b","/photo/a","/photo/b"])")));
            EXPECT_EQ(row.lines, Queue()) << lockCall;
            Script::Current().Finish();
        }
    }
}

}  // namespace
}  // namespace fileindex_test
