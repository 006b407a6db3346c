// Which names, paths and shares may be indexed.
#include "fixture.h"

#include <vork/share.h>

#include <filesystem>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

class Indexability : public FileIndexTest {
protected:
    /// /vol1/photo            a share
    ///   2015/, #recycle/x/, #snapshot/x/, mounted/
    ///   link -> 2015, loop -> itself
    /// /vol2/other/remote, image, pseudo, strange: places on other file systems, in the share "other"
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("other", "/vol2/other");
        for (const char *directory :
             {"2015", "#recycle/x", "a#recycle", "#snapshot/x", "a#snapshot", "mounted", ".DS_Store/x", "#bin"}) {
            fs::create_directories(std::string("/vol1/photo/") + directory);
        }
        fs::create_symlink("2015", "/vol1/photo/link");
        fs::create_symlink("loop", "/vol1/photo/loop");
        for (const char *directory : {"remote", "image", "pseudo", "strange"}) {
            fs::create_directories(std::string("/vol2/other/") + directory);
        }
        Platform &platform = Platform::Current();
        platform.fsTypes = {{"/vol2/other/remote", kRemoteFs},
                            {"/vol2/other/image", kImageFs},
                            {"/vol2/other/pseudo", kPseudoFs},
                            {"/vol2/other/strange", -1},
                            {"/unknown", -1}};
        platform.recycleBins = {"/vol1/photo/#recycle", "/vol1/photo/#bin"};
        platform.snapshots = {"/vol1/photo/#snapshot", "/vol1/photo/#bin"};
        platform.mountPoints = {"/vol1/photo/mounted"};
    }
};

TEST_F(Indexability, OfNamesFollowsTheTableByteForByte) {
    for (const auto &[name, preserved] : {std::pair(".TemporaryItems", true),
                                          {"VORK@.fileindexdb", true},
                                          {"VORK@file_index_queue", true},
                                          {".VORKPPSDB", true},
                                          {".DS_Store", true},
                                          {"@eaDir", true},
                                          {".ds_store", false},
                                          {".DS_Store2", false},
                                          {"VORK@file_index_queue.tmp", false},
                                          {"DS_Store", false},
                                          {"", false},
                                          {"photo", false}}) {
        EXPECT_EQ(preserved, IsSystemPreservedFileName(name)) << name;
    }
    Fail({.call = "VORKEAIsHiddenDir", .result = 2});
    EXPECT_FALSE(IsSystemPreservedFileName("@eaDir")) << "only 1 is a yes";
}

TEST_F(Indexability, SkipsWhatThePlatformConfirms) {
    const struct {
        const char *name, *path;
        bool skipped;
    } rows[] = {
        {"a plain folder", "/vol1/photo/2015", false},
        {"no slash at all", "photo", true},
        {"a trailing slash", "/vol1/photo/", false},
        {"a system name", "/vol1/photo/.DS_Store", true},
        {"below a system name", "/vol1/photo/.DS_Store/x", false},
        {"a metadata directory", "/vol1/photo/@eaDir", true},
        {"in the recycle bin", "/vol1/photo/#recycle/x", true},
        {"named like a recycle bin", "/vol1/photo/a#recycle", false},
        {"in a bin of another name", "/vol1/photo/#bin", false},
        {"in a snapshot", "/vol1/photo/#snapshot/x", true},
        {"named like a snapshot", "/vol1/photo/a#snapshot", false},
        {"remote", "/vol2/other/remote/x", true},
        {"image", "/vol2/other/image/x", true},
        {"pseudo", "/vol2/other/pseudo/x", true},
        {"of unknown type", "/vol2/other/strange/x", false},
        {"a system name of unknown type", "/vol2/other/strange/.DS_Store", true},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(row.skipped, IsSkipIndex(row.path)) << row.name;
    }
    Fail({.call = "VLIBFhsPathInSnapshot"});
    EXPECT_FALSE(IsSkipIndex("/vol1/photo/#snapshot/x")) << "a failing question counts as no";
    EXPECT_EQ("", Left());
}

TEST_F(Indexability, OfFullPathsLeavesItsReason) {
    const std::string refused = "0 utils.cpp:263 check realpath failed, path=";
    const std::string base = "/vol1/photo";
    const std::string tooLong = "/" + std::string(5000, 'x');
    const char *const yes[] = {"/2015", "", "/.DS_Store", "/a#recycle", "/#bin", "/a#snapshot"};
    const char *const no[] = {"/vol1/photo/#recycle/x",
                              "/vol1/photo/#snapshot/x",
                              "/vol2/other/remote",
                              "/vol2/other/image",
                              "/vol2/other/pseudo",
                              "/vol2/other/strange",
                              "/unknown"};  // of unknown type and outside every share: silent
    const std::string notReal[] = {"/link", "/link/..", "/loop", "/", "//2015", "/./2015", "/none", tooLong};
    for (const std::string path : yes) {
        EXPECT_TRUE(CanFullPathBeIndexed(base + path)) << path;
    }
    for (const char *path : no) {
        EXPECT_FALSE(CanFullPathBeIndexed(path)) << path;
    }
    EXPECT_EQ("", Left());
    for (const std::string &path : notReal) {
        const std::string fullPath = base + path;
        EXPECT_FALSE(CanFullPathBeIndexed(fullPath));
        EXPECT_EQ(refused + fullPath, Left());
    }
    EXPECT_FALSE(CanFullPathBeIndexed("/vol9/x"));
    EXPECT_EQ(
        "2 utils.cpp:418 VORKShareNamePathGet failed, path=/vol9/x | "
        "utils.cpp:239 GetShareNamePathByFullPath failed, path=/vol9/x",
        Left());
    EXPECT_FALSE(CanFullPathBeIndexed("/vol1/photo/mounted"));
    EXPECT_EQ("0 utils.cpp:256 Mount point[/vol1/photo/mounted] is not allowed to be indexed", Left());
}

TEST_F(Indexability, OfAMountPointDependsOnEncryption) {
    Platform::Current().shares["photo"].encryptionKind = true;
    EXPECT_TRUE(CanFullPathBeIndexed("/vol1/photo/mounted"));
    Platform::Current().shares["photo"].encryptionKind = false;
    Fail({.call = "VLIBShareIsEncryptionGet"});
    EXPECT_TRUE(CanFullPathBeIndexed("/vol1/photo/mounted")) << "a failing question counts as encrypted";
    Fail({.call = "VORKFSDirIsMntPoint", .times = 2, .result = 2});
    EXPECT_TRUE(CanFullPathBeIndexed("/vol1/photo/mounted")) << "only 1 is a yes";
    EXPECT_TRUE(CanFullPathBeIndexed("/vol1/photo/2015"));
    EXPECT_EQ("", Left());
}

TEST_F(Indexability, OfSharesFollowsNameAndState) {
    const struct {
        const char *name;
        FakeShare share;
        std::string failing;
        bool indexable;
    } rows[] = {
        {"plain", {}, "", true},
        {"NetBackup", {}, "", false},
        {"surveillance", {}, "", false},
        {"netbackup", {}, "", true},
        {"Surveillance", {}, "", true},
        {"locked", {.encrypted = true}, "", false},
        {"of the encrypted kind", {.encryptionKind = true}, "", true},
        {"read-only", {.readOnly = true}, "", false},
        {"not to be asked", {}, "VLIBShareIsEncryptedGet", false},
        {"not to be asked either", {}, "VLIBShareIsReadOnlyGet", false},
    };
    EXPECT_FALSE(CanShareBeIndexed(nullptr));
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        const std::string directory = "/vol1/photo/" + std::string(row.name);
        fs::create_directory(directory);
        Platform::Current().shares = {{row.name, row.share}};
        Platform::Current().shares[row.name].path = directory;
        if (!row.failing.empty()) {
            Fail({.call = row.failing, .times = 2});
        }
        _tag_VORKSHARE *share = nullptr;
        ASSERT_EQ(0, VORKShareGet(row.name, &share));
        EXPECT_EQ(row.indexable, CanShareBeIndexed(share));
        VORKShareFree(share);
        EXPECT_EQ(row.indexable, CanFullPathBeIndexed(directory));
    }
    EXPECT_EQ("", Left());
}

TEST_F(Indexability, OfASharePathIsThatOfItsFullPath) {
    EXPECT_TRUE(CanPathBeIndexed("/photo/2015"));
    EXPECT_FALSE(CanPathBeIndexed("/photo/#recycle/x"));
    EXPECT_EQ("", Left());
    EXPECT_FALSE(CanPathBeIndexed("/none/x"));
    EXPECT_EQ("2 utils.cpp:191 GetFullPath failed, path=/none/x", Left());
    EXPECT_FALSE(CanPathBeIndexed(""));
    EXPECT_EQ("2 utils.cpp:389 GetShareNameByPath failed, path= | utils.cpp:191 GetFullPath failed, path=",
              Left());
    Fail({.call = "VORKShareGet", .nth = 2});
    EXPECT_FALSE(CanPathBeIndexed("/photo/2015"));
    EXPECT_EQ("0 utils.cpp:245 VORKShareGet failed, share=photo", Left());
}

TEST_F(Indexability, OfAShareWithoutSpaceIsRefusedOnlyForSpaceOrQuota) {
    const std::string question = "0 /vol1/photo 10485760";
    EXPECT_TRUE(IsShareSpaceEnough("photo"));
    EXPECT_EQ(1, Script::Current().Calls("VORKQuotaIsEnough", question));
    for (const auto &[error, enough] :
         {std::pair(0x2900, false), {0x2400, false}, {0x0900, true}, {0, true}, {0x2901, true}}) {
        Fail({.call = "VORKQuotaIsEnough", .result = 0, .error = error});
        EXPECT_EQ(enough, IsShareSpaceEnough("photo")) << error;
        Script::Current().Finish();
    }
    Fail({.call = "VORKQuotaIsEnough", .result = -1, .error = 0x2900});
    EXPECT_TRUE(IsShareSpaceEnough("photo")) << "every result but 0 is a yes";
    EXPECT_EQ("", Left());
    EXPECT_FALSE(IsShareSpaceEnough("none"));
    EXPECT_EQ("0 utils.cpp:361 VORKShareGet failed, share=none", Left());
}

}  // namespace
}  // namespace fileindex_test
