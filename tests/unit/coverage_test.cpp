// Which paths and shares are indexed, asked of the class interface and of the C functions, and the lookups.
#include "fixture.h"

#include <string>
#include <vector>

namespace fileindex_test {
namespace {

class Coverage : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenFolders({FolderRecord("/photo/2019", "Year", "p"), FolderRecord("/gone/x", "", "d")});
    }
};

TEST_F(Coverage, FollowsComponentsAndBytes) {
    const struct {
        const char *path;
        bool indexed, containsIndexed;
    } rows[] = {
        {"/photo/2019", true, true},
        {"/photo/2019/a/b", true, false},
        {"/photo/2019/", true, false},
        {"/photo/20190", false, false},
        {"/photo", false, true},
        {"/photo/", false, false},
        {"/Photo/2019", false, false},
        {"/photo//2019", false, false},
        {"", false, true},
        {"/", false, false},
        {"photo/2019", false, false},
        {"/gone/x/y", true, false},
        {"/photo/2019/../x", true, false},
        {"/gone", false, true},
    };
    std::vector<Folder> folders;
    ASSERT_TRUE(IndexMgr::List(folders));
    for (const auto &row : rows) {
        SCOPED_TRACE(row.path);
        EXPECT_EQ(row.indexed, IndexMgr::IsPathIndexed(row.path));
        EXPECT_EQ(row.indexed, IndexMgr::IsPathIndexed(row.path, folders));
        EXPECT_EQ(row.indexed ? 1 : 0, FILEIDXIsPathIndexed(row.path));
        EXPECT_EQ(row.containsIndexed, IndexMgr::IsPathContainIndexed(row.path));
        EXPECT_EQ(row.containsIndexed, IndexMgr::IsPathContainIndexed(row.path, folders));
    }
    EXPECT_FALSE(IndexMgr::IsPathIndexed("/photo/2019", {}));
    EXPECT_FALSE(IndexMgr::IsPathContainIndexed("", {}));
}

TEST_F(Coverage, OfFullPathsKnowsOnlyFoldersWhoseShareIsThere) {
    const struct {
        const char *path;
        bool indexed;
    } rows[] = {{"/vol1/photo/2019", true},
                {"/vol1/photo/2019/x", true},
                {"/vol1/photo/2019/", true},
                {"/vol1/photo/20190", false},
                {"/vol1/photo", false},
                {"/photo/2019", false},
                {"", false},
                {"/", false},
                {"/gone/x", false}};
    std::vector<Folder> folders;
    ASSERT_TRUE(IndexMgr::List(folders));
    for (const auto &row : rows) {
        SCOPED_TRACE(row.path);
        EXPECT_EQ(row.indexed, IndexMgr::IsFullPathIndexed(row.path));
        EXPECT_EQ(row.indexed, IndexMgr::IsFullPathIndexed(row.path, folders));
        EXPECT_EQ(row.indexed ? 1 : 0, FILEIDXIsFullPathIndexed(row.path));
    }
}

TEST_F(Coverage, OfSharesComparesWholeNames) {
    for (const auto &[share, indexed] : {std::pair("photo", true),
                                         {"Photo", false},
                                         {"photos", false},
                                         {"phot", false},
                                         {"gone", true},
                                         {"", false},
                                         {"music", false}}) {
        EXPECT_EQ(indexed, IndexMgr::IsShareIndexed(share)) << share;
        EXPECT_EQ(indexed ? 1 : 0, FILEIDXIsShareIndexed(share)) << share;
    }
    EXPECT_EQ("2", Left()) << "the share of /gone/x cannot be resolved";

    GivenFolders({FolderRecord("", "", ""), FolderRecord("/photo", "", "")});
    EXPECT_TRUE(IndexMgr::IsShareIndexed("photo"));
    ASSERT_FALSE(SyslogCapture::Records().empty());
    EXPECT_EQ("index_mgr.cpp", SyslogCapture::Records().back().file);
    EXPECT_EQ("Failed to get share name from path: ", SyslogCapture::Records().back().message);
}

TEST_F(Coverage, IsNoneWithoutFoldersOrWithoutAReadableFile) {
    for (const char *text : {"{}", "{", "[]"}) {
        SCOPED_TRACE(text);
        GivenFolderConf(text);
        EXPECT_FALSE(IndexMgr::IsPathIndexed("/photo/2019"));
        EXPECT_FALSE(IndexMgr::IsPathContainIndexed(""));
        EXPECT_FALSE(IndexMgr::IsFullPathIndexed("/vol1/photo/2019"));
        EXPECT_FALSE(IndexMgr::IsShareIndexed("photo"));
        EXPECT_EQ(0, FILEIDXIsPathIndexed("/photo/2019"));
        EXPECT_EQ(0, FILEIDXIsFullPathIndexed("/vol1/photo/2019"));
        EXPECT_EQ(0, FILEIDXIsShareIndexed("photo"));
        std::vector<Folder> folders;
        EXPECT_EQ(std::string(text) == "{}", IndexMgr::List(folders));
        EXPECT_THAT(folders, IsEmpty());
    }
}

TEST_F(Coverage, AnswersNoToANullPointer) {
    EXPECT_EQ(0, FILEIDXIsPathIndexed(nullptr));
    EXPECT_EQ(0, FILEIDXIsFullPathIndexed(nullptr));
    EXPECT_EQ(0, FILEIDXIsShareIndexed(nullptr));
}

}  // namespace
}  // namespace fileindex_test
