// The paged, sorted listing.
#include "fixture.h"

#include <string>
#include <vector>

namespace fileindex_test {
namespace {

constexpr unsigned long kAll = 1000;

class Listing : public FileIndexTest {
protected:
    /// Names in another order than the paths; letters of both cases.
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenFolders({FolderRecord("/photo/1", "d", "d"), FolderRecord("/photo/2", "B", "a"),
                      FolderRecord("/photo/3", "E", "v"), FolderRecord("/photo/Z", "a", "p"),
                      FolderRecord("/photo/m", "C", "davp")});
    }

    /// The page's names, and the total and the offset told with it.
    static std::string Page(unsigned long offset, unsigned long limit, const std::string &by,
                            const std::string &direction) {
        Json::Value out = "before";
        EXPECT_TRUE(IndexMgr::List(out, offset, limit, by, direction, Json::Value(Json::arrayValue)));
        EXPECT_EQ(3U, out.size());
        EXPECT_TRUE(out["folder"].isArray());
        std::string page;
        for (const Json::Value &folder : out["folder"]) {
            EXPECT_EQ(7U, folder.size());
            EXPECT_EQ("{}", Print(folder["additional"]));
            page += folder["name"].asString();
        }
        return page + " " + out["total"].asString() + " " + out["offset"].asString();
    }
};

TEST_F(Listing, IsSortedAndPaged) {
    const struct {
        const char *name;
        unsigned long offset, limit;
        const char *by, *direction, *page;
    } rows[] = {
        {"by name, any case alike", 0, kAll, "name", "ASC", "aBCdE 5 0"},
        {"a page", 1, 2, "name", "ASC", "BC 5 1"},
        {"descending leaves the offset out", 1, 2, "name", "DESC", "Ba 5 1"},
        {"descending, what the offset leaves", 3, kAll, "name", "DESC", "Ba 5 3"},
        {"descending, whole", 0, kAll, "name", "DESC", "EdCBa 5 0"},
        {"another spelling ascends", 0, kAll, "name", "desc", "aBCdE 5 0"},
        {"no direction ascends", 0, kAll, "name", "", "aBCdE 5 0"},
        {"by path, any case alike", 0, kAll, "path", "ASC", "dBECa 5 0"},
        {"another key is the path", 0, kAll, "Name", "ASC", "dBECa 5 0"},
        {"no key is the path", 0, kAll, "", "DESC", "aCEBd 5 0"},
        {"no limit given", 0, 0, "name", "ASC", " 5 0"},
        {"offset at the end", 5, kAll, "name", "ASC", " 5 5"},
        {"offset at the end, descending", 5, kAll, "name", "DESC", " 5 5"},
        {"offset beyond the end", 6, kAll, "name", "ASC", " 5 6"},
        {"offset beyond the end, descending", 6, kAll, "name", "DESC", " 5 6"},
        {"offset beyond 32 bits", 1UL << 40, kAll, "name", "ASC", " 5 1099511627776"},
        {"no bounds", 2, ~0UL, "name", "ASC", "CdE 5 2"},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(row.page, Page(row.offset, row.limit, row.by, row.direction)) << row.name;
    }
    EXPECT_EQ(0, Script::Current().Calls("flock", kFolderLock));
}

TEST_F(Listing, PutsRecordsWithTheFlagLast) {
    for (const auto &[flag, with] :
         {std::pair("document", "dC"), {"audio", "BC"}, {"video", "EC"}, {"photo", "aC"}}) {
        const std::string page = Page(0, 5, flag, "ASC").substr(0, 5);
        EXPECT_THAT(page.substr(3), testing::AnyOf(with, std::string(with[1] + std::string(1, with[0]))))
            << flag << " " << page;
    }
}

TEST_F(Listing, CarriesTheAdditionalFactsAndOutlivesBadKeys) {
    Json::Value out;
    EXPECT_TRUE(IndexMgr::List(out, 0, 1, "path", "ASC", Parse(R"(["is_valid","none"])")));
    EXPECT_EQ(R"({"is_valid":false,"none":null})", Print(out["folder"][0]["additional"]))
        << "there is no directory";
    EXPECT_EQ(FILEINDEX_ERR_BAD_PARAM, LeftCode());
    EXPECT_TRUE(IndexMgr::List(out, 0, kAll, "path", "ASC", "status"));
    EXPECT_EQ(5U, out["folder"].size());
}

TEST_F(Listing, OfNothingOrOfNoReadableFile) {
    GivenFolderConf("{}");
    EXPECT_EQ(" 0 0", Page(0, kAll, "name", "ASC"));
    EXPECT_EQ(" 0 3", Page(3, kAll, "name", "DESC"));
    GivenFolderConf("{");
    Json::Value out = "before";
    EXPECT_FALSE(IndexMgr::List(out, 0, kAll, "name", "ASC", Json::Value()));
    EXPECT_EQ(kFolderConfUnreadable, Left());
    EXPECT_EQ("before", out);
}

}  // namespace
}  // namespace fileindex_test
