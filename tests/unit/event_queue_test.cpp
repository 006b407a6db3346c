// Events for the daemon in a share's queue file.
#include "fixture.h"

#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr char kPath[] = "/vol1/photo/a";
constexpr int kReindex = 0x10000;
constexpr int kSetting = 0x20000;
const std::string kSettingLine = R"({"data":{"audio":true},"event":131072,"path":"/vol1/photo/a"})";
const std::string kReindexLine = R"({"data":null,"event":65536,"path":"/vol1/photo/a"})";
const std::string kNeedReindex = R"({"need_reindex":{"photo":true}})";

class EventQueue : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
    }
    static bool AddSetting() { return AddCustomEvent(kSetting, kPath, Parse(R"({"audio":true})")); }
};

TEST_F(EventQueue, GetsOneLineForEachEvent) {
    ::umask(0);
    EXPECT_TRUE(AddSetting());
    EXPECT_TRUE(AddCustomEvent(kReindex, kPath, Json::Value()));
    EXPECT_TRUE(AddCustomEvent(-1, "/vol1/photo", "\xff\n"));
    EXPECT_EQ(kSettingLine + "\n" + kReindexLine + "\n" +
                  "{\"data\":\"\xff\\n\",\"event\":-1,\"path\":\"/vol1/photo\"}\n",
              ReadFile(kQueue));
    EXPECT_EQ(fs::perms(0644), fs::status(kQueue).permissions());
    EXPECT_EQ("(missing)", StatusConf());
    EXPECT_EQ("", Left());
}

TEST_F(EventQueue, StaysALineWhateverTheCallersTextHeld) {
    Json::Value data = Parse(R"({"audio":true})");
    data["audio"].setComment(std::string("// a line\n"), Json::commentBefore);
    data.setComment(std::string("/* and\n another */"), Json::commentBefore);
    EXPECT_TRUE(AddCustomEvent(kSetting, kPath, data));
    EXPECT_EQ(kSettingLine + "\n", ReadFile(kQueue));
}

TEST_F(EventQueue, IsNotReadInALineBeyondOneMebibyte) {
    const std::string endless =
        R"({"event":65536,"data":")" + std::string(1 << 20, 'x') + R"(","path":"/vol1/photo/a"})";
    GivenQueue(endless + "\n" + kReindexLine + "\n");
    EXPECT_TRUE(AddSetting());
    EXPECT_EQ(2U, Queue().size()) << "covered by what is behind it";
    GivenQueue(endless + "\n");
    EXPECT_TRUE(AddSetting());
    EXPECT_THAT(Queue(), ElementsAre(endless, kSettingLine));
}

TEST_F(EventQueue, HeldByAnotherLosesTheEventAfterThreeAttempts) {
    GivenQueue("");
    Script::Current().random = 13;
    const LockAgent reader(kQueue);
    for (const int level : {3, 7}) {
        Forget();
        LOG_LEVEL = level;
        EXPECT_TRUE(AddSetting());
        EXPECT_EQ(3, Script::Current().Calls("flock", kQueue));
        EXPECT_EQ(3, Script::Current().Calls("usleep", "3000"));
    }
    EXPECT_EQ(std::string("0 utils.cpp:516 try lock too many times, path=") + kQueue +
                  ", reason=Resource temporarily unavailable",
              Left());
    EXPECT_EQ("", ReadFile(kQueue));
    EXPECT_EQ("(missing)", StatusConf());
}

TEST_F(EventQueue, HeldForAMomentGetsTheEventInTheEnd) {
    GivenQueue("");
    LockAgent reader(kQueue);
    Fail({.call = "usleep", .nth = 2, .action = [&] { reader.Release(); }});
    Fail({.call = "flock", .about = kQueue, .error = EINTR});
    EXPECT_TRUE(AddSetting());
    EXPECT_THAT(Queue(), ElementsAre(kSettingLine));
}

TEST_F(EventQueue, TakenAwayBeforeTheLockIsOpenedAgainAtOnce) {
    GivenQueue("");
    const std::string taken = std::string(kQueue) + ".taken";
    Fail({.call = "flock", .about = kQueue, .times = 9, .action = [&] { fs::rename(kQueue, taken); }});
    EXPECT_TRUE(AddSetting());
    EXPECT_EQ("", ReadFile(taken));
    EXPECT_THAT(Queue(), ElementsAre(kSettingLine));
    EXPECT_EQ(0, Script::Current().Calls("usleep"));
    EXPECT_EQ(0, fs::exists(kStatusConf));
}

TEST_F(EventQueue, AlwaysTakenAwayEndsTheAttempts) {
    GivenQueue("");
    const std::string taken = std::string(kQueue) + ".taken";
    Fail({.call = "flock", .about = kQueue, .times = kAlways, .action = [&] { fs::rename(kQueue, taken); }});
    AddSetting();
    EXPECT_EQ("", ReadFile(taken));
    EXPECT_LE(Script::Current().Calls("openat", kQueue), 16 + 3);
}

TEST_F(EventQueue, WrittenShortCountsAsWritten) {
    GivenQueue("");
    for (const int level : {3, 7}) {
        Forget();
        LOG_LEVEL = level;
        Fail({.call = "write", .about = kQueue, .result = 5});
        EXPECT_TRUE(AddSetting());
        Fail({.call = "write", .about = kQueue, .error = ENOSPC});
        EXPECT_TRUE(AddSetting());
        Script::Current().Finish();
    }
    const std::string size = std::to_string(kSettingLine.size() + 1);
    EXPECT_EQ("0 utils.cpp:502 write fail, (5, " + size + ") | utils.cpp:502 write fail, (-1, " + size + ")",
              Left());
    EXPECT_EQ("", ReadFile(kQueue)) << "cut off again";
    EXPECT_EQ("(missing)", StatusConf());
}

TEST_F(EventQueue, IsNotLostBehindALineThatBrokeOff) {
    GivenQueue(kReindexLine + "\n" + R"({"event":1,"pa)");
    EXPECT_TRUE(AddCustomEvent(kSetting, "/vol1/photo/b", Json::Value()));
    EXPECT_TRUE(AddCustomEvent(kSetting, "/vol1/photo/c", Json::Value()));
    const std::string lineOf[] = {R"({"data":null,"event":131072,"path":"/vol1/photo/b"})",
                                  R"({"data":null,"event":131072,"path":"/vol1/photo/c"})"};
    EXPECT_THAT(Queue(), ElementsAre(kReindexLine, R"({"event":1,"pa)", lineOf[0], lineOf[1]));
    EXPECT_EQ(1, Script::Current().Calls("write", std::to_string(lineOf[0].size() + 2))) << "all in one";

    GivenQueue("x");
    LOG_LEVEL = 7;
    Fail({.call = "write", .about = kQueue, .result = 3});
    EXPECT_TRUE(AddSetting());
    EXPECT_EQ("x", ReadFile(kQueue));
    EXPECT_EQ("0 utils.cpp:502 write fail, (3, " + std::to_string(kSettingLine.size() + 2) + ")", Left());
}

TEST_F(EventQueue, GoesToTheDirectoryThatWasLookedAt) {
    GivenQueue("");
    const std::string directory = fs::path(kQueue).parent_path();
    fs::create_directory("/vol1/photo/victim");
    Fail({.call = "openat", .about = kQueue, .nth = 2, .action = [&] {
              fs::rename(directory, "/vol1/photo/hidden");
              fs::create_directory_symlink("victim", directory);
          }});
    EXPECT_TRUE(AddSetting());
    EXPECT_TRUE(fs::is_empty("/vol1/photo/victim"));
    EXPECT_EQ(kSettingLine + "\n", ReadFile("/vol1/photo/hidden/VORK@file_index_queue"));
}

TEST_F(EventQueue, ThatCannotBeUsedMarksTheShareForReindexing) {
    const std::string elsewhere = "/vol1/photo/elsewhere";
    const std::pair<const char *, std::function<void()>> rows[] = {
        {"no lock", [] { Fail({.call = "flock", .about = kQueue, .error = ENOLCK}); }},
        {"directory", [] { fs::create_directory(kQueue); }},
        {"fifo", [] { ::mkfifo(kQueue, 0600); }},
        {"link", [&] { fs::create_symlink(elsewhere, kQueue); }},
        {"link to a file", [&] { WriteFile(elsewhere, ""), fs::create_symlink(elsewhere, kQueue); }},
        {"another file", [&] { WriteFile(elsewhere, ""), fs::create_hard_link(elsewhere, kQueue); }},
        {"no memory", [] { Fail({.call = "openat", .about = kQueue, .action = [] { throw std::bad_alloc(); }}); }},
    };
    fs::create_directory("/vol1/photo/@eaDir");
    LOG_LEVEL = 7;
    for (const auto &[name, plant] : rows) {
        SCOPED_TRACE(name);
        const bool isNoLock = std::string(name) == "no lock";
        fs::remove(elsewhere);
        fs::remove(kQueue);
        fs::remove(kStatusConf);
        plant();
        const bool isOther = std::string(name) == "another file";
        EXPECT_EQ("no" + (isNoLock ? " 0 utils.cpp:507 flock fail, path=" + std::string(kQueue) +
                                         ", reason=No locks available"
                          : isOther ? " 0 utils.cpp:95 Failed to open queue=" + std::string(kQueue) +
                                          ", reason=Too many links"
                                    : ""),
                  AskAlone("AddCustomEvent /vol1/photo/a"));
        EXPECT_EQ(kNeedReindex, StatusConf());
        EXPECT_EQ(isOther || std::string(name) == "link to a file" ? "" : "(missing)", ReadFile(elsewhere));
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }
}

TEST_F(EventQueue, SaysWhenNotEvenTheMarkCanBeSet) {
    const LockAgent other(kStatusLock);
    Fail({.call = "openat", .about = kQueue, .error = EMFILE});
    EXPECT_FALSE(AddSetting());
    EXPECT_EQ(kBusy + " | utils.cpp:522 ShareSetNeedReindex failed, share=photo", Left());
}

}  // namespace
}  // namespace fileindex_test
