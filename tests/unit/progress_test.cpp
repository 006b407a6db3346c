// How far indexing has got: overall, for one folder, and as an additional fact of a folder's record.
#include "fixture.h"

#include <cerrno>
#include <filesystem>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr char kQueue[] = "/vol1/photo/@eaDir/VORK@file_index_queue";

std::string EventLine(const std::string &path) {
    return R"({"event":2,"path":")" + path + "\"}\n";
}

std::string RenameLine(const std::string &path, const std::string &oldPath) {
    return R"({"event":256,"path":")" + path + R"(","path_old":)" + oldPath + "}\n";
}

class Progress : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        Script::Current().now = 1700000000;
        GivenShare("photo");
        GivenShare("music");
        fs::create_directories("/vol1/photo/a");
        fs::create_directories("/vol1/photo/b");
        GivenFolders({FolderRecord("/photo/a", "A", "p"), FolderRecord("/music", "M", "a")});
    }
    static std::string Overall() {
        std::string status = "unset";
        return StatusMgr::GetStatus(status) ? status : "failed, " + status;
    }
};

TEST_F(Progress, IsSeenInTheQueuesThatAreLeft) {
    const struct {
        const char *name, *share, *suffix, *overall;
    } rows[] = {
        {"a queue, even an empty one", "photo", "", "processing"},
        {"only the companion", "music", ".tmp", "processing"},
    };
    EXPECT_EQ("finished", Overall());
    for (const auto &row : rows) {
        GivenQueue(row.share, "", row.suffix);
        EXPECT_EQ(row.overall, Overall()) << row.name;
        fs::remove_all("/vol1/" + std::string(row.share) + "/@eaDir");
    }
    fs::create_directories(kQueue);
    EXPECT_EQ("finished", Overall()) << "a directory is no queue";
}

TEST_F(Progress, ShowsAPauseOnlyWhileWorkIsPending) {
    const struct {
        const char *status, *pending, *folder;
    } rows[] = {
        {"{}", "processing", "processing"},
        {R"({"resume_time":-1})", "processing", "processing"},
        {R"({"resume_time":0})", "paused", "paused"},
        {R"({"resume_time":1699999999})", "processing", "processing"},
        {R"({"resume_time":1700000000})", "processing", "processing"},
        {R"({"resume_time":1700000001})", "paused", "paused"},
        {R"({"resume_time":9700000000})", "paused", "paused"},
        {R"({"resume_time":"soon"})", "failed, unset", "processing"},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.status);
        GivenStatusConf(row.status);
        fs::remove_all("/vol1/photo/@eaDir");
        EXPECT_EQ("finished", Overall());
        EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
        GivenQueue("photo", EventLine("/vol1/photo/a"));
        EXPECT_EQ(row.pending, Overall());
        EXPECT_EQ(row.folder, StatusMgr::GetFolderStatus("/photo/a"));
    }
}

TEST_F(Progress, LeavesOutFoldersThatMayNotBeIndexed) {
    GivenQueue("photo", EventLine("/vol1/photo/a"));
    Platform::Current().shares["photo"].readOnly = true;
    EXPECT_EQ("finished", Overall());
    EXPECT_EQ("paused", StatusMgr::GetFolderStatus("/photo/a"));
}

TEST_F(Progress, OfAFolderWithoutAShareCannotBeTold) {
    GivenFolders({FolderRecord("", "", "")});
    EXPECT_EQ("failed, unset", Overall());
    EXPECT_THAT(Left(), testing::EndsWith("status_mgr.cpp:135 Failed to get share name from path: "));
}

TEST_F(Progress, OfAFolderIsSeenInTheEventsAtOrBelowIt) {
    const std::string junk =
        "no json\n[]\n{}\n{\"event\":\"2\",\"path\":\"/vol1/photo/a\"}\n"
        "{\"event\":2,\"path\":5}\n{\"path\":\"/vol1/photo/a\"}\n{\"event\":2}\n";
    const struct {
        const char *name;
        std::string queue, companion;
        const char *status;
        size_t malformed;
    } rows[] = {
        {"nothing", "", "", "finished", 0},
        {"itself", EventLine("/vol1/photo/a"), "", "processing", 0},
        {"below", EventLine("/vol1/photo/a/x/y"), "", "processing", 0},
        {"above", EventLine("/vol1/photo"), "", "finished", 0},
        {"a sibling", EventLine("/vol1/photo/ab"), "", "finished", 0},
        {"other case", EventLine("/vol1/photo/A"), "", "finished", 0},
        {"only in the companion", "", EventLine("/vol1/photo/a"), "processing", 0},
        {"moved to it", RenameLine("/vol1/photo/a", R"("/vol1/photo/z")"), "", "processing", 0},
        {"moved from it", RenameLine("/vol1/photo/z", R"("/vol1/photo/a/x")"), "", "processing", 0},
        {"moved from it, in another order", R"({"path_old":"/vol1/photo/a","event":256,"path":"/z"})", "",
         "processing", 0},
        {"an event beyond 32 bits", R"({"event":4294967296,"path":"/vol1/photo/a"})", "", "finished", 1},
        {"a path with a NUL", std::string("{\"event\":2,\"path\":\"/vol1/photo/a\0\"}", 35), "", "finished", 1},
        {"a comment", R"({"event":2,"path":"/vol1/photo/a" /* c */})", "", "finished", 1},
        {"an event that is no number", R"({"event":-,"path":"/vol1/photo/a"})", "", "finished", 1},
        {"moved elsewhere", RenameLine("/vol1/photo/z", R"("/vol1/photo/y")"), "", "finished", 0},
        {"an old path without a rename", R"({"event":2,"path":"/z","path_old":"/vol1/photo/a"})", "", "finished",
         0},
        {"an old path that is no text", RenameLine("/vol1/photo/z", "5"), "", "finished", 0},
        {"malformed lines", junk, "", "finished", 7},
        {"behind malformed lines", junk + EventLine("/vol1/photo/a"), junk, "processing", 7},
        {"malformed lines on both sides", junk, junk, "finished", 14},
        {"a line beyond 1 MiB", std::string(2 << 20, 'x') + "\n" + EventLine("/vol1/photo/a"), "", "processing",
         1},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Forget();
        GivenQueue("photo", row.queue);
        GivenQueue("photo", row.companion, ".tmp");
        EXPECT_EQ(row.status, StatusMgr::GetFolderStatus("/photo/a"));
        EXPECT_EQ(row.malformed, SyslogCapture::Records().size());
    }
    Forget();
    GivenQueue("photo", "not json\n");
    StatusMgr::GetFolderStatus("/photo/a");
    EXPECT_EQ("0 status_mgr.cpp:47 Malformed command: not json", Left());
}

TEST_F(Progress, CountsALineOnlyWhenItIsWhole) {
    for (const char *data :
         {"", R"("data":null,)", R"("data":{"audio":true,"document":false,"photo":true,"video":true},)"}) {
        const std::string line =
            std::string("{") + data + R"("event":256,"path":"/vol1/photo/a","path_old":"/vol1/photo/b"})";
        for (size_t size = 1; size <= line.size(); ++size) {
            GivenQueue("photo", line.substr(0, size));
            EXPECT_EQ(size == line.size() ? "processing" : "finished", StatusMgr::GetFolderStatus("/photo/a"))
                << size;
            Forget();
        }
    }
}

TEST_F(Progress, SeesAQueueThatIsReadWithTroubleAsFarAsItGoes) {
    GivenQueue("photo", EventLine("/vol1/photo/a"));
    Fail({.call = "pread", .about = kQueue, .error = EINTR});
    EXPECT_EQ("processing", StatusMgr::GetFolderStatus("/photo/a"));
    Fail({.call = "pread", .about = kQueue, .error = EIO});
    EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
    Fail({.call = "open", .about = kQueue, .action = [] { fs::remove(kQueue), fs::create_directory(kQueue); }});
    EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
    EXPECT_EQ(std::string("0 status_mgr.cpp:37 Failed to open queue=") + kQueue + ", reason=Invalid argument",
              Left());
}

TEST_F(Progress, OfAShareWithoutSpaceIsAnErrorWhateverIsQueued) {
    GivenStatusConf(R"({"no_space":{"photo":true},"resume_time":0})");
    EXPECT_EQ("err_no_space", StatusMgr::GetFolderStatus("/photo/a"));
    GivenQueue("photo", EventLine("/vol1/photo/a"));
    EXPECT_EQ("err_no_space", StatusMgr::GetFolderStatus("/photo/a"));
    EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/music"));
    EXPECT_EQ("paused", StatusMgr::GetFolderStatus("/none/x")) << "what may not be indexed comes first";
}

TEST_F(Progress, IsAnAdditionalFactOfAFolder) {
    GivenQueue("photo", EventLine("/vol1/photo/a"));
    Folder folder;
    folder.Load("/photo/a", Json::Value());
    const struct {
        const char *keys;
        bool result;
        const char *additional;
        std::string left;
    } rows[] = {
        {"[]", true, "{}", ""},
        {R"(["status","is_valid"])", true, R"({"is_valid":true,"status":"processing"})", ""},
        {R"(["status","Status","is_valid"])", true, R"({"Status":null,"is_valid":true,"status":"processing"})",
         "1 folder.cpp Unknown additional: Status | folder.cpp Failed to get additional: Status"},
        {R"(["status",5,"is_valid"])", false, R"({"status":"processing"})", "1 folder.cpp Bad param: 5"},
        {R"("status")", false, "{}", R"(1 folder.cpp Bad param: "status")"},
        {R"({"status":true})", false, "{}", R"(1 folder.cpp Bad param: {"status":true})"},
        {"null", false, "{}", "1 folder.cpp Bad param: null"},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.keys);
        Json::Value out = "before";
        EXPECT_EQ(row.result, folder.GetAdditional(out, Parse(row.keys)));
        EXPECT_EQ(row.additional, Print(out));
        EXPECT_EQ(row.left, Left());
        const Json::Value record = folder.asJson(Parse(row.keys));
        EXPECT_EQ(7U, record.size());
        EXPECT_EQ(row.additional, Print(record["additional"]));
        EXPECT_EQ(row.left + (row.result ? "" : " | folder.cpp GetAdditional failed"), Left());
    }
    Json::Value out = "before";
    EXPECT_FALSE(folder.GetAdditional(out, std::string("size")));
    EXPECT_EQ("before", out);
    EXPECT_TRUE(folder.GetAdditional(out, std::string("is_valid")));
    EXPECT_EQ(Json::Value(true), out);
}

}  // namespace
}  // namespace fileindex_test
