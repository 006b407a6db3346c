// The index when shares are renamed, removed and cleaned, and after an upgrade.
#include "fixture.h"

#include <cerrno>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

class ShareLifecycle : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        GivenShare("new", "/vol2/new");
        GivenFolders({FolderRecord("/music", "M", "a"), FolderRecord("/photo/a", "A", "p")});
        Platform::Current().searchOn = true;
    }
};

TEST_F(ShareLifecycle, RenameMovesTheFoldersOfTheShareAndTellsNobody) {
    GivenFolders({FolderRecord("/photo", "All", "d"), FolderRecord("/photo/a/b", "B", "p"),
                  FolderRecord("/photos/a", "", "v"), FolderRecord("/music", "M", "a")});
    EXPECT_TRUE(IndexMgr::ShareRename("photo", "new"));
    EXPECT_EQ(Canonical("{" + FolderRecord("/music", "M", "a") + "," + FolderRecord("/new", "All", "d") + "," +
                        FolderRecord("/new/a/b", "B", "p") + "," + FolderRecord("/photos/a", "", "v") + "}"),
              FolderConf());
    const std::string renamed = FolderConf();
    EXPECT_TRUE(IndexMgr::ShareRename("nobody", "new"));
    EXPECT_EQ(renamed, FolderConf());
    EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "saved folder.conf", "unlock folder",
                                       "lock folder exclusive", "saved folder.conf", "unlock folder"));
    EXPECT_FALSE(fs::exists(kStatusConf));
}

TEST_F(ShareLifecycle, RenameWorksWhenTheOldShareIsGoneAndFailsWhenTheNewOneIsNotThere) {
    Platform::Current().shares.erase("photo");
    const std::string conf = ReadFile(kFolderConf);
    EXPECT_FALSE(IndexMgr::ShareRename("photo", "unborn"));
    EXPECT_EQ(FILEINDEX_ERR_BAD_PARAM, LeftCode());
    EXPECT_EQ(conf, ReadFile(kFolderConf));
    EXPECT_TRUE(IndexMgr::ShareRename("photo", "new"));
    EXPECT_EQ("{" + FolderRecord("/music", "M", "a") + "," + FolderRecord("/new/a", "A", "p") + "}", FolderConf());
}

TEST_F(ShareLifecycle, RemoveDropsTheFoldersAndStopsIndexingOnlyAfterTheLast) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb");
    EXPECT_TRUE(IndexMgr::ShareRemove("photo"));
    EXPECT_EQ("{" + FolderRecord("/music", "M", "a") + "}", FolderConf());
    EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "saved folder.conf", "unlock folder"));
    EXPECT_TRUE(fs::exists("/vol1/photo/@eaDir/VORK@.fileindexdb"));
    Forget();
    Platform::Current().shares.erase("music");  // a share that is gone already is removed like any other
    EXPECT_TRUE(IndexMgr::ShareRemove("music"));
    EXPECT_EQ("{}", FolderConf());
    EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "saved folder.conf", "stop fileindexd 1",
                                       "search 0", "restart samba", "unlock folder"));
}

TEST_F(ShareLifecycle, AnEmptyNameNeverMeansAll) {
    GivenShare("", "/vol2/unnamed");
    GivenFolders({FolderRecord("//x", "", ""), FolderRecord("/photo/a", "", "")});
    EXPECT_TRUE(IndexMgr::ShareRename("", "new"));
    EXPECT_EQ("{" + FolderRecord("/new/x", "", "") + "," + FolderRecord("/photo/a", "", "") + "}", FolderConf());
    EXPECT_TRUE(IndexMgr::ShareRemove(""));
    EXPECT_EQ(2U, Parse(FolderConf()).size());
}

TEST_F(ShareLifecycle, CleaningRemovesTheIndexDataAndNothingElse) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb/deep/er");
    WriteFile("/vol1/photo/@eaDir/other", "kept");
    GivenQueue("photo", "x", ".tmp");
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo"));
    EXPECT_EQ("kept", ReadFile("/vol1/photo/@eaDir/other"));
    Fail({.call = "VLIBCExec", .times = 3, .result = 1});
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo")) << "what rm says does not count";
}

TEST_F(ShareLifecycle, CleaningStopsWhereThePathIsUnknownOrCut) {
    EXPECT_FALSE(IndexMgr::CleanShareIndexData("none"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:653 FILEIDXQueuePathGet failed, share=none"));
    Forget();
    for (size_t length = 4050; length < 4096; ++length) {
        Platform::Current().shares["long"].path = "/" + std::string(length, 'x');
        IndexMgr::CleanShareIndexData("long");
    }
    EXPECT_FALSE(IndexMgr::CleanShareIndexData("long"));
}

TEST_F(ShareLifecycle, UpgradeStopsAtAFolderWithoutAShare) {
    GivenFolders({FolderRecord("", "", "")});
    EXPECT_FALSE(Updater_zol60_beta2());
    EXPECT_EQ("0 utils.cpp:389 GetShareNameByPath failed, path= | utils.cpp:661 GetShareNameByPath failed, path=",
              Left());
}

}  // namespace
}  // namespace fileindex_test
