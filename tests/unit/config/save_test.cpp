// A save in place: what it leaves, whatever fails.
#include "fixture.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

/// A document of so many bytes.
std::string Filled(char c, size_t size) {
    return "{\"x\":\"" + std::string(size - 8, c) + "\"}";
}

const std::string kNew = R"({"a":1})";

class ConfigSave : public FileIndexTest {
protected:
    static bool Saves(const std::string &text) {
        const auto descriptors = OpenDescriptors();
        const bool saved = Document(text).Save();
        EXPECT_EQ(saved ? "" : kStatusConfUnwritable, Left());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        EXPECT_EQ(descriptors, OpenDescriptors());
        return saved;
    }

    static std::string Loaded() {
        Document document;
        return document.Load() ? document.Text() : "(unreadable)";
    }

    static std::vector<std::string> Files() {
        std::vector<std::string> names;
        for (const auto &entry : fs::directory_iterator(kConfigDir)) {
            names.push_back(entry.path().filename());
        }
        return names;
    }
};

TEST_F(ConfigSave, ReplacesTheContentInPlaceLongerOrShorter) {
    GivenStatusConf(R"({"old":"document"})");
    const ino_t inode = StatusOf(kStatusConf).st_ino;
    for (const std::string &text :
         {std::string(R"({"new":"and longer than before"})"), std::string("{}"), Filled('x', 100000),
          std::string("{\"\xff\xfe\":\"\xc3\"}"),
          Canonical(R"({"a":[null,true,-1,18446744073709551615,0.5,"\u0001\"\\\n"],"o":{}})")}) {
        EXPECT_TRUE(Saves(text));
        EXPECT_EQ(text + "\n", ReadFile(kStatusConf));
        EXPECT_EQ(inode, StatusOf(kStatusConf).st_ino);
        EXPECT_EQ(text, Loaded());
    }
    EXPECT_THAT(Files(), ElementsAre("status.conf"));
}

TEST_F(ConfigSave, LeavesOneFileOfMode0644WhateverTheUmask) {
    for (const mode_t mask : {0U, 0022U, 0777U}) {
        ::umask(mask);
        fs::remove(kStatusConf);
        EXPECT_TRUE(Saves(kNew));
        EXPECT_EQ(0100644U, StatusOf(kStatusConf).st_mode) << mask;
        ::chmod(kStatusConf, 0600);
        EXPECT_TRUE(Saves(kNew));
        EXPECT_EQ(0100644U, StatusOf(kStatusConf).st_mode) << mask;
    }
    Fail({.call = "chmod", .about = kStatusConf, .error = EPERM});
    EXPECT_TRUE(Document(kNew).Save());
    EXPECT_EQ(std::string("config.cpp chmod failed, path=") + kStatusConf, Left());
}

TEST_F(ConfigSave, LeavesTheOldBytesOrTheNewDocument) {
    const std::string old = R"({"old": "document"}   )";
    const std::string longer = Filled('n', 9000);
    const struct {
        const char *name;
        Fault fault;
        std::string text;
        bool saved;
    } rows[] = {
        {"not to be opened", {.call = "open", .about = kStatusConf, .error = EACCES}, longer, false},
        {"not to be read", {.call = "pread", .about = kStatusConf}, longer, false},
        {"no room for the tail", {.call = "write", .about = kStatusConf, .error = ENOSPC}, longer, false},
        {"interrupted", {.call = "write", .about = kStatusConf, .error = EINTR}, longer, false},
        {"the tail cut", {.call = "write", .about = kStatusConf, .result = 5000}, longer, false},
        {"the tail not flushed", {.call = "fdatasync", .about = kStatusConf}, longer, false},
        {"the head not written", {.call = "write", .about = kStatusConf, .nth = 2}, longer, false},
        {"the head cut", {.call = "write", .about = kStatusConf, .nth = 2, .result = 1}, "{}", false},
        {"the head not flushed", {.call = "fdatasync", .about = kStatusConf, .nth = 2}, longer, false},
        {"never flushed", {.call = "fdatasync", .about = kStatusConf, .nth = 2, .times = 3}, longer, false},
        {"always interrupted", {.call = "fdatasync", .times = 202, .error = EINTR}, longer, false},
        {"interrupted 100 times", {.call = "fdatasync", .times = 100, .error = EINTR}, longer, true},
        {"the tail not cut off", {.call = "ftruncate", .about = kStatusConf}, "{}", true},
        {"the length not flushed", {.call = "fdatasync", .about = kStatusConf, .nth = 3}, "{}", true},
        {"not closed", {.call = "close", .about = kStatusConf}, "{}", true},
        {"a file system that knows no flush", {.call = "fdatasync", .times = 3, .error = EINVAL}, "{}", true},
        {"or has none", {.call = "fdatasync", .times = 3, .error = ENOSYS}, "{}", true},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Forget();
        GivenStatusConf(old);
        Fail(row.fault);
        EXPECT_EQ(row.saved, Saves(row.text));
        EXPECT_EQ(row.saved ? row.text : Canonical(old), Loaded());
        EXPECT_TRUE(row.saved || (ReadFile(kStatusConf) == old && Calls("chmod") == 0));
        EXPECT_TRUE(Saves(kNew));
        EXPECT_EQ(kNew + "\n", ReadFile(kStatusConf)) << "nothing is left of the tail";
    }
}

TEST_F(ConfigSave, WhoseHeadIsCutRestoresTheOldBytesHoweverRoughTheWayBack) {
    constexpr long kSize = 153600;
    for (const size_t oldSize : {kSize / 2, kSize, kSize * 2}) {
        const std::string old = Filled('o', oldSize);
        for (long done = 1; done < kSize; done += 3 * 4096) {
            GivenStatusConf(old);
            Fail({.call = "write", .about = kStatusConf, .nth = 2, .result = done});
            Fail({.call = "write", .about = kStatusConf, .nth = 3, .error = EINTR});
            Fail({.call = "write", .about = kStatusConf, .nth = 4, .result = 4096});
            ASSERT_FALSE(Saves(Filled('n', kSize)));
            ASSERT_TRUE(old == ReadFile(kStatusConf)) << oldSize << " " << done;
        }
    }
    // Without any way back the tail is the only whole document, and stays.
    Fail({.call = "write", .about = kStatusConf, .nth = 2, .result = 3});
    Fail({.call = "write", .about = kStatusConf, .nth = 3});
    EXPECT_FALSE(Saves(kNew));
    EXPECT_EQ(kNew, Loaded());
}

TEST_F(ConfigSave, RefusesWhatNoLoadWouldAccept) {
    struct Made : Status {
        explicit Made(const Json::Value &document) { document_ = document; }
    };
    const Json::Value allowed = Parse(Times(256, "[") + Times(256, "]"));
    Json::Value refused[2];
    refused[0]["a"] = HUGE_VAL;
    refused[1].append(allowed);
    GivenStatusConf(kNew);
    for (const Json::Value &document : refused) {
        EXPECT_FALSE(Made(document).Save());
        EXPECT_EQ(kStatusConfUnwritable, Left());
        EXPECT_EQ(kNew, StatusConf());
    }
    EXPECT_TRUE(Made(allowed).Save());
    EXPECT_EQ(Print(allowed), Loaded());
}

TEST_F(ConfigSave, OfANewFileTakesEveryWayAndLeavesNoneWhenItFails) {
    const Fault nameless = {.call = "open", .about = kConfigDir, .nth = 2, .error = EOPNOTSUPP};
    const Fault nameOnce = {.call = "linkat"};
    const Fault nameNever = {.call = "linkat", .times = 2, .error = ENOENT};
    const Fault made = {.call = "linkat", .action = [] { GivenStatusConf(R"({"theirs":"and longer"})"); }};
    const Fault nothingWritten = {.call = "write", .about = kConfigDir, .error = ENOSPC};
    const Fault nameNotFlushed = {.call = "fsync", .about = kConfigDir, .nth = 2};
    const struct {
        const char *name;
        std::vector<Fault> faults;
        bool saved;
    } rows[] = {
        {"not to be opened", {{.call = "open", .about = kConfigDir, .times = 2, .error = EACCES}}, false},
        {"not to be made", {{.call = "open", .about = kConfigDir, .nth = 2, .error = EACCES}}, false},
        {"nothing written", {nothingWritten}, false},
        {"written short", {{.call = "write", .about = kConfigDir, .result = 1}}, false},
        {"its mode left to the end", {{.call = "fchmod"}}, true},
        {"not flushed", {{.call = "fsync", .about = kConfigDir}}, false},
        {"its name not flushed", {nameNotFlushed}, false},
        {"named in the second way", {nameOnce}, true},
        {"made by another meanwhile", {made}, true},
        {"named from the start", {nameless}, true},
        {"named from the start in the end", {nameNever}, true},
        {"not to be named", {nameNever, {.call = "open", .about = kStatusConf, .nth = 2, .error = EEXIST}}, false},
        {"named, nothing written", {nameless, nothingWritten}, false},
        {"named, not flushed", {nameless, {.call = "fsync", .about = kStatusConf}}, false},
        {"named, its name not flushed", {nameless, nameNotFlushed}, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove(kStatusConf);
        std::for_each(row.faults.begin(), row.faults.end(), Fail);
        EXPECT_EQ(row.saved, Saves(kNew));
        EXPECT_EQ(row.saved ? kNew : "(missing)", StatusConf());
        EXPECT_EQ(row.saved ? 1U : 0U, Files().size());
    }
}

TEST_F(ConfigSave, TouchesNothingThatWasPlantedAtItsPath) {
    const std::string target = "/usr/vork/etc/target";
    const std::function<void()> plants[] = {
        [&] { fs::create_symlink(target, kStatusConf); },
        [&] { fs::create_symlink(target + "-none", kStatusConf); },
        [] { ::mkfifo(kStatusConf, 0600); },
        [] { fs::create_directory(kStatusConf); },
        [] { fs::remove_all(kConfigDir); },
    };
    WriteFile(target, "precious");
    for (const auto &plant : plants) {
        fs::remove(kStatusConf);
        plant();
        const auto type = fs::symlink_status(kStatusConf).type();
        EXPECT_FALSE(Saves(kNew));
        EXPECT_EQ(type, fs::symlink_status(kStatusConf).type());
        EXPECT_EQ("precious", ReadFile(target));
        EXPECT_FALSE(fs::exists(target + "-none"));
    }
    EXPECT_FALSE(fs::exists(kConfigDir));
}

}  // namespace
}  // namespace fileindex_test
