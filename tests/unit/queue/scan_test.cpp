// Reading queue files: borders of blocks and lines, holes, trouble, and a consumer who is at work meanwhile.
#include "fixture.h"

#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <functional>
#include <limits>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr size_t kBlock = 65536;
constexpr size_t kLimit = 1048576;
const std::string kTmp = std::string(kQueue) + ".tmp";

std::string ReindexOf(const std::string &name) {
    return R"({"data":null,"event":65536,"path":"/vol1/photo/)" + name + "\"}";
}

/// A line about this name, of so many bytes.
std::string Line(const std::string &name, size_t size) {
    const std::string line = R"({"event":65536,"path":"/vol1/photo/)" + name + R"(","x":""})";
    return line.substr(0, line.size() - 2) + std::string(size - line.size(), 'x') + "\"}";
}

class QueueScan : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenFolderConf(R"({"/photo/a":{}})");
    }
    /// Is there a line about /photo/a? Asked in both ways.
    static bool IsSeen() {
        Forget();
        const bool shown = StatusMgr::GetFolderStatus("/photo/a") == "processing";
        const bool covers = AddCustomEvent(1, "/vol1/photo/a", Json::Value()) && Calls("write", "_queue") == 0;
        EXPECT_EQ(shown, covers);
        return shown;
    }
    static bool IsSeenIn(const std::string &text) {
        GivenQueue(text);
        return IsSeen();
    }
};

// The last line ends shortly before, at or after the border of a block.
TEST_F(QueueScan, SeesEveryLineWhereverABlockEnds) {
    for (const size_t border : {kBlock, 2 * kBlock, kLimit, kLimit + kBlock}) {
        for (const size_t end : {border - 60, border - 2, border - 1, border, border + 1, border + 60}) {
            const size_t others = end / 128 - 2;
            const std::string text = Times(others, Line("b", 127) + "\n") + Line("a", end - others * 128 - 1);
            for (const char *tail : {"\n", "", "\n{\"torn", "\n{}\n"}) {
                EXPECT_TRUE(IsSeenIn(text + tail)) << end << tail;
            }
        }
    }
}

TEST_F(QueueScan, PassesOverALineBeyondOneMebibyte) {
    for (const size_t size : {kLimit - 1, kLimit, kLimit + 1, kLimit + kBlock, kLimit + kBlock + 1, 2 * kLimit}) {
        for (const size_t before : {size_t{0}, size_t{100}, kBlock}) {
            SCOPED_TRACE(std::to_string(size) + " after " + std::to_string(before));
            const std::string head = before == 0 ? "" : Line("b", before - 1) + "\n";
            const std::string line = Line("a", size);
            EXPECT_EQ(size <= kLimit, IsSeenIn(head + line));
            EXPECT_EQ(size <= kLimit, IsSeenIn(head + line + "\n" + ReindexOf("c") + "\n"));
            Forget();
            StatusMgr::GetFolderStatus("/photo/a");
            EXPECT_EQ(size <= kLimit ? "" : "status_mgr.cpp:47 Malformed command: " + line.substr(0, 256), Left());
            EXPECT_TRUE(IsSeenIn(head + Line("b", size) + "\n" + ReindexOf("a"))) << "what follows";
        }
    }
}

TEST_F(QueueScan, CountsALineOnlyWhenItIsWhole) {
    for (const char *data :
         {"", R"("data":null,)", R"("data":{"audio":true,"document":false,"photo":true,"video":true},)"}) {
        const std::string line =
            std::string("{") + data + R"("event":65536,"path":"/vol1/photo/a","path_old":"/b"})";
        for (size_t size = 1; size <= line.size(); ++size) {
            EXPECT_EQ(size == line.size(), IsSeenIn(line.substr(0, size))) << size;
        }
    }
}

TEST_F(QueueScan, SeesWhatFollowsHolesOfAnySize) {
    const off_t last = std::numeric_limits<off_t>::max() - static_cast<off_t>(ReindexOf("a").size()) - 1;
    for (const off_t offset : {off_t{100}, off_t{1} << 16, off_t{1} << 30, off_t{1} << 40, last}) {
        GivenQueue(ReindexOf("b") + "\ntorn");
        ASSERT_EQ(0, ::truncate(kQueue, offset - 1));
        EXPECT_EQ("finished", StatusMgr::GetFolderStatus("/photo/a"));
        std::ofstream file(kQueue, std::ios::in | std::ios::out);
        ASSERT_TRUE(file.seekp(offset - 1) << "\n" << ReindexOf("a") << "\n" << std::flush) << offset;
        EXPECT_TRUE(IsSeen()) << offset;
        EXPECT_LT(Calls("pread"), 20) << offset;
        EXPECT_EQ("status_mgr.cpp:47 Malformed command: torn", Left());
    }
}

TEST_F(QueueScan, GoesAsFarAsItCan) {
    const std::string unopened = "status_mgr.cpp:37 Failed to open queue=" + std::string(kQueue) + ", reason=";
    GivenQueue(ReindexOf("a"));
    Fail({.call = "pread", .about = kQueue, .error = EINTR});
    EXPECT_TRUE(IsSeen());
    Fail({.call = "pread", .about = kQueue});
    EXPECT_EQ("finished", AskAlone("GetFolderStatus /photo/a"));
    fs::rename("/vol1/photo/@eaDir", "/vol1/photo/elsewhere");
    fs::create_directory_symlink("elsewhere", "/vol1/photo/@eaDir");
    EXPECT_EQ("finished; " + unopened + "Not a directory", AskAlone("GetFolderStatus /photo/a"));
    Fail({.call = "openat", .about = kQueue, .action = [] { fs::remove(kQueue), fs::create_directory(kQueue); }});
    fs::remove("/vol1/photo/@eaDir");
    fs::rename("/vol1/photo/elsewhere", "/vol1/photo/@eaDir");
    EXPECT_EQ("finished; " + unopened + "Invalid argument", AskAlone("GetFolderStatus /photo/a"));
    EXPECT_EQ("finished", AskAlone("GetStatus")) << "a directory is no queue";
}

// The consumer renames the queue to its companion: it is looked for under the former name first.
TEST_F(QueueScan, FindsAQueueThatIsTakenBetweenTheTwoLooks) {
    GivenStatusConf("{}");
    for (const char *call : {"AddCustomEvent /vol1/photo/a", R"(Reindex ["/photo/a","/photo/a"])", "GetStatus",
                             "GetFolderStatus /photo/a"}) {
        for (const int look : {1, 2}) {
            fs::remove(kTmp);
            GivenQueue(ReindexOf("a"));
            Forget();
            Fail({.call = "lstat", .about = "VORK@file_index_queue", .nth = look, .action = [] {
                      fs::rename(kQueue, kTmp);
                  }});
            EXPECT_THAT(AskAlone(call), testing::AnyOf("yes", "processing")) << call << look;
            EXPECT_EQ(0, Calls("write", "_queue")) << call << look;
            Script::Current().Finish();
        }
    }
}

/// The consumer or another writer does something between the first two events of a request that asks for a, b, a,
/// b: at the end of the first lock, before the queue is looked at for b, or at the start of the second, after
/// that.
TEST_F(QueueScan, SeesTheQueueAsItIsAtEachEventOfARequest) {
    const std::string a = ReindexOf("a");
    const std::string b = ReindexOf("b");
    const std::string c = ReindexOf("c");
    const auto append = [](const std::string &text) { std::ofstream(kQueue, std::ios::app) << text; };
    const auto replace = [](const std::string &text) {
        fs::rename(kQueue, std::string(kQueue) + ".old");
        WriteFile(kQueue, text);
    };
    using Lines = std::vector<std::string>;
    const struct {
        const char *name;
        std::string before;
        std::function<void()> between;
        Lines early;
        Lines late;
    } rows[] = {
        {"nothing", "", [] {}, {a, b}, {a, b}},
        {"taken and worked off", "", [] { fs::remove(kQueue); }, {b, a}, {b, a}},
        {"taken", "", [] { fs::rename(kQueue, kTmp); }, {b}, {b}},
        {"emptied in place", "", [] { WriteFile(kQueue, ""); }, {b, a}, {b, a}},
        {"written anew in place, of the same size",
         "",
         [&] { WriteFile(kQueue, c + "\n"); },
         {c, b, a},
         {c, b, a}},
        {"written anew in place, shorter",
         c + "\n" + c + "\n",
         [&] { WriteFile(kQueue, b + "\n"); },
         {b, a},
         {b, b, a}},
        {"replaced by a longer one", "", [&] { replace(c + "\n" + c + "\n"); }, {c, c, b, a}, {c, c, b, a}},
        {"replaced by one with b", c + "\n", [&] { replace(b + "\n" + c + "\n"); }, {b, c, a}, {b, c, b, a}},
        {"appended to", c + "\n", [&] { append(b + "\n"); }, {c, a, b}, {c, a, b, b}},
    };
    for (const auto &row : rows) {
        for (const int lockCall : {2, 3}) {
            SCOPED_TRACE(row.name + std::to_string(lockCall));
            fs::remove_all("/vol1/photo/@eaDir");
            GivenQueue(row.before);
            Fail({.call = "flock", .about = kQueue, .nth = lockCall, .action = row.between});
            EXPECT_TRUE(IndexMgr::Reindex(Parse(R"(["/photo/a","/photo/b","/photo/a","/photo/b"])")));
            EXPECT_EQ(lockCall == 2 ? row.early : row.late, Queue());
            Script::Current().Finish();
        }
    }
}

// A line that a writer is still at is read again from its beginning.
TEST_F(QueueScan, ReadsALineAgainThatHasGrown) {
    const std::string c = ReindexOf("c") + "\n";
    for (const size_t others : {size_t{0}, size_t{1}, kBlock / c.size(), 3 * kBlock / c.size()}) {
        const std::string b = ReindexOf("b");
        GivenQueue(Times(others, c) + b.substr(0, 40));
        Fail({.call = "flock", .about = kQueue, .action = [&] {
                  std::ofstream(kQueue, std::ios::app) << b.substr(40) << "\n";
              }});
        EXPECT_TRUE(IndexMgr::Reindex(Parse(R"(["/photo/a","/photo/b"])")));
        EXPECT_EQ(Times(others, c) + b + "\n" + ReindexOf("a") + "\n", ReadFile(kQueue)) << others;
    }
    GivenQueue(c + ReindexOf("b"));
    EXPECT_TRUE(IndexMgr::Reindex(Parse(R"(["/photo/b","/photo/a","/photo/b"])")));
    EXPECT_EQ(c + ReindexOf("b") + "\n" + ReindexOf("a") + "\n", ReadFile(kQueue))
        << "without its newline it counts";
}

}  // namespace
}  // namespace fileindex_test
