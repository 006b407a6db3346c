// Requests that are nested deeper than anyone reads them, up to more levels than a stack has room for, and numbers
// that no JSON has: written they would be a line, a command or a document that nobody reads.
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

std::string Text(size_t levels, const std::string &inner = {}) {
    return Times(levels, "[") + inner + Times(levels, "]");
}

class Depth : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenFolderConf(R"({"/photo/a":{}})");
        daemon_.Start();
    }
    static void ExpectRefused(const Json::Value &data) {
        EXPECT_FALSE(SendCammandToDaemon("x", data));
        EXPECT_FALSE(AddCustomEvent(1, "/vol1/photo/a", data));
        EXPECT_EQ("", Left());
        EXPECT_FALSE(IndexMgr::Update("/photo/a", data));
        EXPECT_EQ("BAD_PARAM; index_mgr.cpp:436 AddCustomEvent failed", Left());
    }
};

TEST_F(Depth, OfARequestIsLimited) {
    const std::string bad = "BAD_PARAM; ";
    EXPECT_FALSE(IndexMgr::Upsert(Nested(256)));
    EXPECT_EQ(
        bad + "folders.cpp Bad param: " + Text(255) + "; index_mgr.cpp:582 Upsert failed, folder=" + Text(255),
        Left());
    const auto expectRefused = [&](int levels) {
        const Json::Value &deep = Nested(levels);
        const std::string element = levels == 257 ? Text(256) : Text(256, "...");
        EXPECT_FALSE(IndexMgr::Upsert(deep));
        EXPECT_EQ(bad + "index_mgr.cpp:569 Bad param: " + Text(256, "..."), Left());
        EXPECT_FALSE(IndexMgr::Delete(deep));
        EXPECT_EQ(bad + "index_mgr.cpp:61 Bad param: " + element, Left());
        EXPECT_FALSE(IndexMgr::Reindex(deep));
        EXPECT_EQ(bad + "index_mgr.cpp:377 Malformed jsArrPath: " + element, Left());
        Json::Value facts;
        EXPECT_FALSE(Folder().GetAdditional(facts, deep));
        EXPECT_EQ(bad + "folder.cpp Bad param: " + element, Left());
    };
    expectRefused(257);
    expectRefused(60000);
}

TEST_F(Depth, OfAnEventAndOfACommandCountsTheLevelAroundTheData) {
    EXPECT_TRUE(AddCustomEvent(1, "/vol1/photo/a", Nested(255)));
    EXPECT_EQ("processing", StatusMgr::GetFolderStatus("/photo/a")) << "whoever reads the line accepts it";
    EXPECT_TRUE(SendCammandToDaemon("x", Nested(255)));
    ExpectRefused(Nested(256));
    ExpectRefused(Nested(60000));
    for (const double number : {HUGE_VAL, -HUGE_VAL, std::nan("")}) {
        Json::Value request = Parse(R"(["/photo/a",{"x":[]}])");
        request[1]["x"].append(number);
        ExpectRefused(request[1]);
        EXPECT_FALSE(IndexMgr::Upsert(request));
        EXPECT_THAT(Left(), testing::StartsWith("BAD_PARAM; index_mgr.cpp:569 Bad param: "));
    }
    EXPECT_EQ(1U, Queue().size());
    EXPECT_EQ(1U, daemon_.Frames().size());
    EXPECT_EQ(R"({"need_reindex":{"photo":true}})", StatusConf());
}

}  // namespace
}  // namespace fileindex_test
