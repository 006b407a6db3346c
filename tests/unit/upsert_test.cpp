// Adding and changing indexed folders: requests of every kind.
#include "fixture.h"

#include <filesystem>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

class IndexUpsert : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        daemon_.Start();
    }
    static bool Upsert(const std::string &request) { return IndexMgr::Upsert(Parse(request)); }
};

TEST_F(IndexUpsert, HasTwoOtherNames) {
    const Json::Value request = Parse(R"([{"path":"/photo/a","name":"A","video":true}])");
    std::vector<std::string> journal;
    for (const auto operation : {IndexMgr::Upsert, IndexMgr::Set, IndexMgr::Add}) {
        fs::remove(kFolderConf);
        fs::remove_all("/vol1/photo/@eaDir");
        Platform::Current().searchOn = false;
        Forget();
        EXPECT_TRUE(operation(request));
        EXPECT_EQ("{" + FolderRecord("/photo/a", "A", "v") + "}", FolderConf());
        EXPECT_TRUE(journal.empty() || journal == Journal());
        journal = Journal();
    }
}

TEST_F(IndexUpsert, OfNothingStillSavesAndStartsTheDaemon) {
    Platform::Current().searchOn = true;
    GivenFolders({FolderRecord("/photo/a", "A", "d")});
    EXPECT_TRUE(Upsert("[]"));
    EXPECT_THAT(Journal(),
                ElementsAre("lock folder exclusive", "saved folder.conf", "start fileindexd 1", "unlock folder"));
    EXPECT_EQ(1, Script::Current().Calls("VORKSMBIsEnableSpotlight"));
    EXPECT_EQ("{" + FolderRecord("/photo/a", "A", "d") + "}", FolderConf());
}

TEST_F(IndexUpsert, OfOnePathTwiceSendsTwoCommandsAndTheLaterReport) {
    Platform::Current().searchOn = true;
    EXPECT_TRUE(Upsert(R"([{"path":"/photo/a","audio":true},{"path":"/photo/a","video":true}])"));
    EXPECT_EQ(2U, SentCommands().size());
    EXPECT_THAT(Queue("photo"),
                ElementsAre(R"({"data":{"audio":false,"document":false,"photo":false,"video":true},)"
                            R"("event":131072,"path":"/vol1/photo/a"})"));
    EXPECT_EQ("{" + FolderRecord("/photo/a", "", "av") + "}", FolderConf());
}

TEST_F(IndexUpsert, OfWhatIsNoArrayDoesNothing) {
    for (const char *request : {R"({"path":"/photo/a"})", "null", "7", R"("/photo/a")"}) {
        Forget();
        EXPECT_FALSE(Upsert(request));
        EXPECT_EQ(std::string("1 index_mgr.cpp:569 Bad param: ") + request, Left());
        EXPECT_THAT(Journal(), IsEmpty());
        EXPECT_EQ(0, Script::Current().Calls("open"));
    }
}

TEST_F(IndexUpsert, WithOneBadElementSavesAndTellsNothing) {
    GivenFolders({FolderRecord("/photo/a", "A", "d")});
    const std::string conf = ReadFile(kFolderConf);
    for (const char *element :
         {R"({"path":"/none/x"})", R"({"name":"x"})", "{}", "5", R"("/photo/c")", "null", R"(["/photo/c"])",
          R"({"path":["/photo/c"]})", R"({"path":""})", R"({"path":"/photo/c\u0000d"})"}) {
        SCOPED_TRACE(element);
        Forget();
        EXPECT_FALSE(
            Upsert(std::string(R"([{"path":"/photo/b"},{"path":"/photo/a","audio":true},)") + element + "]"));
        const std::string left = Left();
        EXPECT_TRUE(left.starts_with("1 ")) << left;
        EXPECT_TRUE(left.ends_with(std::string(" | index_mgr.cpp:582 Upsert failed, folder=") + element)) << left;
        EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "unlock folder"));
        EXPECT_EQ(conf, ReadFile(kFolderConf));
    }
}

TEST_F(IndexUpsert, OfAFolderTooManyChangesNothing) {
    std::vector<std::string> records;
    records.reserve(999);
    for (int number = 0; number < 999; ++number) {
        records.push_back(FolderRecord("/photo/" + std::to_string(number), "", "d"));
    }
    GivenFolders(records);
    const std::string conf = ReadFile(kFolderConf);
    EXPECT_FALSE(Upsert(R"([{"path":"/music/a"},{"path":"/music/b"}])"));
    EXPECT_EQ(
        "5 folders.cpp Exceed max folder size | "
        R"(index_mgr.cpp:582 Upsert failed, folder={"path":"/music/b"})",
        Left());
    EXPECT_EQ(conf, ReadFile(kFolderConf));
    EXPECT_TRUE(Upsert(R"([{"path":"/music/a"}])"));
}

}  // namespace
}  // namespace fileindex_test
