// An event into a share's queue file.
#include "fixture.h"

#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <functional>
#include <new>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

const std::string kDirectory = fs::path(kQueue).parent_path();
const std::string kTaken = std::string(kQueue) + ".taken";
const std::string kLine = R"({"data":{"audio":true},"event":131072,"path":"/vol1/photo/a"})";

class QueueAppend : public FileIndexTest {
protected:
    static bool Add() { return AddCustomEvent(0x20000, "/vol1/photo/a", Parse(R"({"audio":true})")); }
    static auto Taking(int times) {
        return Fault{
            .call = "flock", .about = kQueue, .times = times, .action = [] { fs::rename(kQueue, kTaken); }};
    }
};

TEST_F(QueueAppend, WritesOneLineForEachEvent) {
    ::umask(0);
    Json::Value data = Parse(R"({"audio":true})");
    data["audio"].setComment(std::string("// a line\n"), Json::commentBefore);
    data.setComment(std::string("/* and\n another */"), Json::commentBefore);
    EXPECT_TRUE(AddCustomEvent(0x20000, "/vol1/photo/a", data));
    EXPECT_TRUE(AddCustomEvent(-1, "/vol1/photo", "\xff\n"));
    EXPECT_EQ(kLine + "\n{\"data\":\"\xff\\n\",\"event\":-1,\"path\":\"/vol1/photo\"}\n", ReadFile(kQueue));
    EXPECT_EQ(0100644U, StatusOf(kQueue).st_mode);
    EXPECT_EQ("", Left());
}

/// The reasons are recorded at the log level 7, and at no other.
TEST_F(QueueAppend, LosesAnEventRatherThanHoldACallerUp) {
    const std::string size = std::to_string(kLine.size() + 1);
    const std::string longer = std::to_string(kLine.size() + 2);
    const struct {
        const char *name;
        const char *before;
        Fault fault;
        std::string record;
        bool answer = true;
    } rows[] = {
        {"held",
         "",
         {.call = "flock", .about = kQueue, .times = 3, .error = EAGAIN},
         "utils.cpp:516 try lock too many times, path=" + std::string(kQueue) +
             ", reason=Resource temporarily unavailable"},
        {"interrupted",
         "",
         {.call = "flock", .about = kQueue, .times = 3, .error = EINTR},
         "utils.cpp:516 try lock too many times, path=" + std::string(kQueue) +
             ", reason=Interrupted system call"},
        {"no locks",
         "",
         {.call = "flock", .about = kQueue, .error = ENOLCK},
         "utils.cpp:507 flock fail, path=" + std::string(kQueue) + ", reason=No locks available",
         false},
        {"written short, which is cut off",
         "",
         {.call = "write", .about = kQueue, .result = 5},
         "utils.cpp:502 write fail, (5, " + size + ")"},
        {"not written",
         "",
         {.call = "write", .about = kQueue, .error = ENOSPC},
         "utils.cpp:502 write fail, (-1, " + size + ")"},
        {"written short after a torn line",
         "x",
         {.call = "write", .about = kQueue, .result = 3},
         "utils.cpp:502 write fail, (3, " + longer + ")"},
    };
    Script::Current().random = 13;
    for (const auto &row : rows) {
        for (const int level : {0, 3, 6, 7, 8}) {
            SCOPED_TRACE(row.name + std::to_string(level));
            GivenQueue(row.before);
            Forget();
            LOG_LEVEL = level;
            Fail(row.fault);
            EXPECT_EQ(row.answer, Add());
            EXPECT_EQ(level == 7 ? row.record : "", Left());
            EXPECT_EQ(row.before, ReadFile(kQueue));
            EXPECT_EQ(row.fault.times == 3 ? 3 : 0, Calls("usleep", "3000"));
            EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        }
    }
    EXPECT_EQ(R"({"need_reindex":{"photo":true}})", StatusConf()) << "once no locks were known";
}

TEST_F(QueueAppend, IsTriedAgainWhileItMayHelp) {
    GivenQueue("");
    LockAgent reader(kQueue);
    Fail({.call = "usleep", .nth = 2, .action = [&] { reader.Release(); }});
    Fail({.call = "flock", .about = kQueue, .error = EINTR});
    EXPECT_TRUE(Add());
    EXPECT_THAT(Queue(), ElementsAre(kLine));

    // Taken away before the lock, the queue is opened again at once, up to 16 times.
    GivenQueue("");
    Forget();
    Fail(Taking(16));
    EXPECT_TRUE(Add());
    EXPECT_EQ("", ReadFile(kTaken));
    EXPECT_THAT(Queue(), ElementsAre(kLine));
    EXPECT_EQ(0, Calls("usleep"));
    EXPECT_FALSE(fs::exists(kStatusConf));
    Fail(Taking(17));
    EXPECT_FALSE(Add());
    EXPECT_EQ(R"({"need_reindex":{"photo":true}})", StatusConf());
}

TEST_F(QueueAppend, IsNotLostAfterALineThatBrokeOff) {
    GivenQueue(R"({"event":1,"pa)");
    EXPECT_TRUE(Add());
    EXPECT_TRUE(Add());
    EXPECT_THAT(Queue(), ElementsAre(R"({"event":1,"pa)", kLine, kLine));
    EXPECT_EQ(1, Calls("write", std::to_string(kLine.size() + 2))) << "all in one";
}

TEST_F(QueueAppend, GoesToTheDirectoryThatWasLookedAt) {
    GivenQueue("");
    Given("directory /vol1/photo/victim");
    Fail({.call = "openat", .about = kQueue, .nth = 2, .action = [] {
              fs::rename(kDirectory, "/vol1/photo/hidden");
              fs::create_directory_symlink("victim", kDirectory);
          }});
    EXPECT_TRUE(Add());
    EXPECT_TRUE(fs::is_empty("/vol1/photo/victim"));
    EXPECT_EQ(kLine + "\n", ReadFile("/vol1/photo/hidden/VORK@file_index_queue"));
}

TEST_F(QueueAppend, ToWhatIsNoQueueMarksTheShareForReindexing) {
    const std::string elsewhere = "/vol1/photo/elsewhere";
    const std::string links =
        "utils.cpp:95 Failed to open queue=" + std::string(kQueue) + ", reason=Too many links";
    const struct {
        const char *name;
        std::function<void()> plant;
        std::string left = {};
    } rows[] = {
        {"directory", [] { fs::create_directory(kQueue); }},
        {"fifo", [] { ::mkfifo(kQueue, 0600); }},
        {"link", [&] { fs::create_symlink(elsewhere + "-none", kQueue); }},
        {"link to a file", [&] { fs::create_symlink(elsewhere, kQueue); }},
        {"another file", [&] { fs::create_hard_link(elsewhere, kQueue); }, links},
        {"no memory", [] { Fail({.call = "openat", .about = kQueue, .action = [] { throw std::bad_alloc(); }}); }},
        {"nor the mark",
         [] {
             Fail({.call = "openat", .about = kQueue, .error = EMFILE});
             Fail({.call = "flock", .about = kStatusLock, .error = ENOLCK});
         },
         kBusy + "; utils.cpp:522 ShareSetNeedReindex failed, share=photo"},
    };
    WriteFile(elsewhere, "");
    fs::create_directory(kDirectory);
    LOG_LEVEL = 7;
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove(kQueue);
        fs::remove(kStatusConf);
        row.plant();
        EXPECT_EQ("no" + (row.left.empty() ? "" : "; " + row.left), AskAlone("AddCustomEvent /vol1/photo/a"));
        EXPECT_EQ(row.left.starts_with("LOCK") ? "(missing)" : R"({"need_reindex":{"photo":true}})", StatusConf());
        EXPECT_TRUE(fs::is_empty(elsewhere) && !fs::exists(elsewhere + "-none"));
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }
}

}  // namespace
}  // namespace fileindex_test
