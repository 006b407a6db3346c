// A save in place: what it leaves, whatever fails.
#include "fixture.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <filesystem>
#include <set>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

std::set<std::string> Listing(const std::string &directory) {
    std::set<std::string> names;
    for (const auto &entry : fs::directory_iterator(directory)) {
        names.insert(entry.path().filename());
    }
    return names;
}

class ConfigSave : public FileIndexTest {};

TEST_F(ConfigSave, LeavesOneFileOfMode0644WhateverTheUmask) {
    for (const mode_t mask : {0U, 0022U, 0777U}) {
        ::umask(mask);
        fs::remove(kStatusConf);
        EXPECT_TRUE(Document(R"({"a":[1,"x"]})").Save());
        EXPECT_EQ(0100644U, StatusOf(kStatusConf).st_mode) << mask;
        ::chmod(kStatusConf, 0600);
        EXPECT_TRUE(Document(R"({"a":[1,"x"]})").Save());
        EXPECT_EQ(0100644U, StatusOf(kStatusConf).st_mode) << mask;
    }
    EXPECT_EQ(R"({"a":[1,"x"]})", StatusConf());
    EXPECT_EQ(std::set<std::string>{"status.conf"}, Listing(kConfigDir));
}

TEST_F(ConfigSave, ReplacesTheContentInPlaceLongerOrShorter) {
    GivenStatusConf(R"({"old":"document"})");
    const ino_t inode = StatusOf(kStatusConf).st_ino;
    std::string large(100000, 'x');
    for (const std::string &text :
         {std::string(R"({"new":"and longer than before"})"), std::string("{}"), R"({"large":")" + large + "\"}",
          std::string("{\"\xff\xfe\":\"\xc3\"}"),
          Canonical(R"({"a":[null,true,-1,18446744073709551615,0.5,"\u0001\"\\\n"],"o":{}})")}) {
        EXPECT_TRUE(Document(text).Save());
        EXPECT_EQ(text, StatusConf());
        EXPECT_EQ(inode, StatusOf(kStatusConf).st_ino);
        EXPECT_LE(StatusOf(kStatusConf).st_size, static_cast<off_t>(text.size() + 2)) << "no old bytes behind";
        Document again;
        EXPECT_TRUE(again.Load());
        EXPECT_EQ(text, again.Text());
    }
}

TEST_F(ConfigSave, ThatFailsLeavesTheOldBytes) {
    const std::string old = R"({"old": "document"}   )";
    const std::string longer = R"({"new":")" + std::string(9000, 'n') + "\"}";
    const struct {
        const char *name;
        Fault fault;
        std::string text;
    } rows[] = {
        {"not to be opened", {.call = "open", .about = kStatusConf, .error = EACCES}, longer},
        {"no room for the tail", {.call = "write", .about = kStatusConf, .error = ENOSPC}, longer},
        {"interrupted", {.call = "write", .about = kStatusConf, .error = EINTR}, longer},
        {"the tail cut", {.call = "write", .about = kStatusConf, .result = 5000}, longer},
        {"the tail not flushed", {.call = "fdatasync", .about = kStatusConf}, longer},
        {"the head not written", {.call = "write", .about = kStatusConf, .nth = 2}, longer},
        {"the head cut while shrinking", {.call = "write", .about = kStatusConf, .nth = 2, .result = 1}, "{}"},
        {"the head not flushed", {.call = "fdatasync", .about = kStatusConf, .nth = 2}, longer},
        {"never to be flushed", {.call = "fdatasync", .about = kStatusConf, .nth = 2, .times = 3}, longer},
        {"always interrupted", {.call = "fdatasync", .times = 202, .error = EINTR}, longer},
        {"the old bytes not to be read", {.call = "pread", .about = kStatusConf}, longer},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Forget();
        GivenStatusConf(old);
        const auto descriptors = OpenDescriptors();
        Fail(row.fault);
        EXPECT_FALSE(Document(row.text).Save());
        EXPECT_EQ(old, ReadFile(kStatusConf));
        EXPECT_EQ(kStatusConfUnwritable, Left());
        EXPECT_EQ(std::set<std::string>{"status.conf"}, Listing(kConfigDir));
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_EQ(0, Script::Current().Calls("chmod"));
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        EXPECT_TRUE(Document(row.text).Save());
        EXPECT_EQ(row.text, StatusConf());
    }
}

TEST_F(ConfigSave, RefusesWhatNoLoadWouldAccept) {
    struct Made : Status {
        explicit Made(const Json::Value &document) { document_ = document; }
    };
    Json::Value infinite;
    infinite["a"] = HUGE_VAL;
    Json::Value deep;
    for (int level = 0; level < 257; ++level) {
        Json::Value outer(Json::arrayValue);
        outer.append(deep);
        deep = outer;
    }
    GivenStatusConf(R"({"old":"document"})");
    for (const Json::Value &document : {infinite, deep}) {
        EXPECT_FALSE(Made(document).Save());
        EXPECT_EQ(kStatusConfUnwritable, Left());
        EXPECT_EQ(R"({"old":"document"})", StatusConf());
    }
    EXPECT_TRUE(Made(deep[0]).Save());
    EXPECT_TRUE(Document().Load());
}

TEST_F(ConfigSave, SucceedsOnceTheHeadIsFlushed) {
    const std::string old = R"({"old":")" + std::string(9000, 'o') + "\"}";
    const Fault rows[] = {
        {.call = "ftruncate", .about = kStatusConf},
        {.call = "fdatasync", .about = kStatusConf, .nth = 3},
        {.call = "close", .about = kStatusConf},
        {.call = "fdatasync", .times = 3, .error = EINVAL},  // a file system that knows no flush
        {.call = "fdatasync", .times = 3, .error = ENOSYS},
    };
    for (const Fault &fault : rows) {
        SCOPED_TRACE(fault.call + std::to_string(fault.error));
        GivenStatusConf(old);
        Fail(fault);
        EXPECT_TRUE(Document(R"({"new":1})").Save());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        Document read;
        EXPECT_TRUE(read.Load());
        EXPECT_EQ(R"({"new":1})", read.Text());
        EXPECT_TRUE(Document(R"({"newer":1})").Save());
        EXPECT_EQ(R"({"newer":1})", StatusConf()) << "nothing is left of the tail";
    }
}

TEST_F(ConfigSave, WhoseHeadIsCutRestoresTheOldBytesHoweverRoughTheWayBack) {
    constexpr long kSize = 153600;
    constexpr long kBlock = 4096;
    const std::string text = R"({"new":")" + std::string(kSize - 10, 'n') + "\"}";
    for (const long oldSize : {kSize / 2, kSize, kSize * 2}) {
        const std::string old = R"({"old":")" + std::string(static_cast<size_t>(oldSize) - 10, 'o') + "\"}";
        for (long done = 0; done < kSize; done += kBlock) {
            GivenStatusConf(old);
            Fail({.call = "write", .about = kStatusConf, .nth = 2, .result = std::max(1L, done)});
            Fail({.call = "write", .about = kStatusConf, .nth = 3, .error = EINTR});
            Fail({.call = "write", .about = kStatusConf, .nth = 4, .result = kBlock});
            ASSERT_FALSE(Document(text).Save());
            ASSERT_EQ(kStatusConfUnwritable, Left());
            ASSERT_TRUE(old == ReadFile(kStatusConf)) << oldSize << " " << done;
            ASSERT_THAT(Script::Current().Finish(), IsEmpty());
        }
    }
}

// The tail is then the only whole document, and stays.
TEST_F(ConfigSave, WithoutAnyWayBackLeavesTheNewDocument) {
    GivenStatusConf(R"({"old":"document"})");
    Fail({.call = "write", .about = kStatusConf, .nth = 2, .result = 3});
    Fail({.call = "write", .about = kStatusConf, .nth = 3, .error = EIO});
    EXPECT_FALSE(Document(R"({"new":1})").Save());
    EXPECT_EQ(kStatusConfUnwritable, Left());
    Document read;
    EXPECT_TRUE(read.Load());
    EXPECT_EQ(R"({"new":1})", read.Text());
}

TEST_F(ConfigSave, OfANewFileTakesEveryWayAndLeavesNoneWhenItFails) {
    const Fault nameless = {.call = "open", .about = kConfigDir, .nth = 2, .error = EOPNOTSUPP};
    const Fault nameOnce = {.call = "linkat"};
    const Fault nameNever = {.call = "linkat", .times = 2, .error = ENOENT};
    const struct {
        const char *name;
        std::vector<Fault> faults;
        bool saved;
    } rows[] = {
        {"not to be opened", {{.call = "open", .about = kConfigDir, .times = 2, .error = EACCES}}, false},
        {"not to be made", {{.call = "open", .about = kConfigDir, .nth = 2, .error = EACCES}}, false},
        {"nothing written", {{.call = "write", .about = kConfigDir, .error = ENOSPC}}, false},
        {"written short", {{.call = "write", .about = kConfigDir, .result = 1}}, false},
        {"its mode left to the end", {{.call = "fchmod"}}, true},
        {"not flushed", {{.call = "fsync", .about = kConfigDir}}, false},
        {"its name not flushed", {{.call = "fsync", .about = kConfigDir, .nth = 2}}, false},
        {"named in the second way", {nameOnce}, true},
        {"made by another meanwhile",
         {{.call = "linkat", .action = [] { GivenStatusConf(R"({"theirs":"and longer"})"); }}},
         true},
        {"named from the start", {nameless}, true},
        {"named from the start in the end", {nameNever}, true},
        {"not to be named", {nameNever, {.call = "open", .about = kStatusConf, .nth = 2, .error = EEXIST}}, false},
        {"named, nothing written", {nameless, {.call = "write", .about = kConfigDir, .error = ENOSPC}}, false},
        {"named, not flushed", {nameless, {.call = "fsync", .about = kStatusConf}}, false},
        {"named, its name not flushed", {nameless, {.call = "fsync", .about = kConfigDir, .nth = 2}}, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove(kStatusConf);
        const auto descriptors = OpenDescriptors();
        std::for_each(row.faults.begin(), row.faults.end(), Fail);
        EXPECT_EQ(row.saved, Document(R"({"a":1})").Save());
        EXPECT_EQ(row.saved ? "" : kStatusConfUnwritable, Left());
        EXPECT_EQ(row.saved ? R"({"a":1})" : "(missing)", StatusConf());
        EXPECT_EQ(row.saved ? 1U : 0U, Listing(kConfigDir).size());
        EXPECT_EQ(descriptors, OpenDescriptors());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }
}

TEST_F(ConfigSave, TouchesNothingThatWasPlantedAtItsPath) {
    const std::string target = std::string(kConfigDir) + "/target";
    const struct {
        const char *name;
        std::function<void()> plant;
    } rows[] = {
        {"link to a file", [&] { fs::create_symlink(target, kStatusConf); }},
        {"link to nothing", [&] { fs::create_symlink(target + "-none", kStatusConf); }},
        {"fifo", [] { ::mkfifo(kStatusConf, 0600); }},
        {"directory", [] { fs::create_directory(kStatusConf); }},
    };
    WriteFile(target, "precious");
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove(kStatusConf);
        row.plant();
        const auto type = fs::symlink_status(kStatusConf).type();
        EXPECT_FALSE(Document(R"({"a":1})").Save());
        EXPECT_EQ(kStatusConfUnwritable, Left());
        EXPECT_EQ(type, fs::symlink_status(kStatusConf).type());
        EXPECT_EQ("precious", ReadFile(target));
        EXPECT_FALSE(fs::exists(target + "-none"));
    }
}

TEST_F(ConfigSave, DoesNotMakeTheDirectory) {
    const std::string aside = "/usr/vork/etc/aside";
    fs::rename(kConfigDir, aside);
    EXPECT_FALSE(Document("{}").Save());
    EXPECT_EQ(kStatusConfUnwritable, Left());
    EXPECT_FALSE(fs::exists(kConfigDir));
    fs::rename(aside, kConfigDir);
}

TEST_F(ConfigSave, SucceedsWhenOnlyTheModeCannotBeSet) {
    Fail({.call = "chmod", .about = kStatusConf, .error = EPERM});
    EXPECT_TRUE(Document(R"({"a":1})").Save());
    EXPECT_EQ(std::string("0 config.cpp chmod failed, path=") + kStatusConf, Left());
    EXPECT_EQ(R"({"a":1})", StatusConf());
}

}  // namespace
}  // namespace fileindex_test
