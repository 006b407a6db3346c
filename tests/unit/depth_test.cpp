// Requests that are nested deeper than anyone reads them, up to more levels than a stack has room for.
#include "fixture.h"

#include <cmath>
#include <string>
#include <utility>

namespace fileindex_test {
namespace {

/// Never destroyed, nor copied: the JSON library would need more stack than there is.
const Json::Value &Nested(int levels) {
    static auto &kept = *new std::vector<Json::Value *>;
    auto *value = new Json::Value(Json::arrayValue);
    for (int level = 1; level < levels; ++level) {
        Json::Value outer(Json::arrayValue);
        outer.append(std::move(*value));
        *value = std::move(outer);
    }
    kept.push_back(value);
    return *value;
}

std::string Text(int levels) {
    return std::string(static_cast<size_t>(levels), '[') + std::string(static_cast<size_t>(levels), ']');
}

const std::string kShown = std::string(256, '[') + "..." + std::string(256, ']');

class Depth : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        Given("directory /vol1/photo/a");
        GivenFolderConf(R"({"/photo/a":{}})");
    }
};

TEST_F(Depth, OfARequestIsLimited) {
    EXPECT_FALSE(IndexMgr::Upsert(Nested(256)));
    EXPECT_EQ("1 folders.cpp Bad param: " + Text(255) + " | index_mgr.cpp:582 Upsert failed, folder=" + Text(255),
              Left());
    for (const int levels : {257, 60000}) {
        const Json::Value &deep = Nested(levels);
        const std::string element = levels == 257 ? Text(256) : kShown;
        EXPECT_FALSE(IndexMgr::Upsert(deep));
        EXPECT_EQ("1 index_mgr.cpp:569 Bad param: " + kShown, Left());
        EXPECT_FALSE(IndexMgr::Delete(deep));
        EXPECT_EQ("1 index_mgr.cpp:61 Bad param: " + element, Left());
        EXPECT_FALSE(IndexMgr::Reindex(deep));
        EXPECT_EQ("1 index_mgr.cpp:377 Malformed jsArrPath: " + element, Left());
        Json::Value facts;
        EXPECT_FALSE(Folder().GetAdditional(facts, deep));
        EXPECT_EQ("1 folder.cpp Bad param: " + element, Left());
    }
}

// No JSON has them; written they would be a line, a command or a document that nobody reads.
TEST_F(Depth, IsNotAllThatIsLimitedNumbersAreFinite) {
    daemon_.Start();
    for (const double number : {HUGE_VAL, -HUGE_VAL, std::nan("")}) {
        Json::Value data;
        data["x"].append(number);
        EXPECT_FALSE(SendCammandToDaemon("x", data));
        EXPECT_FALSE(AddCustomEvent(1, "/vol1/photo/a", data));
        EXPECT_EQ("", Left());
        EXPECT_FALSE(IndexMgr::Update("/photo/a", data));
        EXPECT_EQ("1 index_mgr.cpp:436 AddCustomEvent failed", Left());
        Json::Value request(Json::arrayValue);
        request.append("/photo/a");
        request.append(data);
        EXPECT_FALSE(IndexMgr::Upsert(request));
        EXPECT_THAT(Left(), testing::StartsWith("1 index_mgr.cpp:569 Bad param: "));
    }
    EXPECT_TRUE(Queue().empty());
    EXPECT_TRUE(daemon_.Frames().empty());
}

TEST_F(Depth, OfAnEventAndOfACommandCountsTheLevelAroundTheData) {
    daemon_.Start();
    EXPECT_TRUE(AddCustomEvent(1, "/vol1/photo/a", Nested(255)));
    EXPECT_EQ("processing", StatusMgr::GetFolderStatus("/photo/a")) << "whoever reads the line accepts it";
    EXPECT_TRUE(SendCammandToDaemon("x", Nested(255)));
    for (const int levels : {256, 60000}) {
        EXPECT_FALSE(SendCammandToDaemon("x", Nested(levels)));
        EXPECT_FALSE(AddCustomEvent(1, "/vol1/photo/a", Nested(levels)));
        EXPECT_EQ("", Left());
        EXPECT_FALSE(IndexMgr::Update("/photo/a", Nested(levels)));
        EXPECT_EQ("1 index_mgr.cpp:436 AddCustomEvent failed", Left());
    }
    EXPECT_EQ(1U, Queue().size());
    EXPECT_EQ(1U, daemon_.Frames().size());
    EXPECT_EQ(R"({"need_reindex":{"photo":true}})", StatusConf());
}

}  // namespace
}  // namespace fileindex_test
