// A configuration file and its lock, by way of status.conf.
#include "fixture.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

/// status.conf with its content in reach.
class Document : public Status {
public:
    Document() = default;
    explicit Document(const std::string &text) { document_ = Parse(text); }
    [[nodiscard]] std::string Text() const { return Print(document_); }
};

class UmaskOf {
public:
    explicit UmaskOf(mode_t mask) : before_(::umask(mask)) {}
    ~UmaskOf() { ::umask(before_); }
    UmaskOf(const UmaskOf &) = delete;
    UmaskOf &operator=(const UmaskOf &) = delete;

private:
    mode_t before_;
};

std::string Nested(size_t depth) {
    return std::string(depth, '[') + std::string(depth, ']');
}

struct stat StatusOf(const std::string &path) {
    struct stat status = {};
    EXPECT_EQ(0, ::stat(path.c_str(), &status)) << path;
    return status;
}

std::set<std::string> Listing(const std::string &directory) {
    std::set<std::string> names;
    for (const auto &entry : fs::directory_iterator(directory)) {
        names.insert(entry.path().filename());
    }
    return names;
}

class ConfigLock : public FileIndexTest {};
class ConfigLoad : public FileIndexTest {};
class ConfigSave : public FileIndexTest {};

TEST_F(ConfigLock, ExcludesOthersUnlessAllAreReaders) {
    for (const bool held : {true, false}) {
        for (const bool asked : {true, false}) {
            SCOPED_TRACE(std::to_string(static_cast<int>(held)) + std::to_string(static_cast<int>(asked)));
            const bool granted = !held && !asked;
            Script::Current().random = 7;
            Document first;
            Document second;
            ASSERT_TRUE(first.Lock(held));
            Forget();
            EXPECT_EQ(granted, second.Lock(asked));
            EXPECT_EQ(granted ? 1 : 3, Script::Current().Calls("flock", kStatusLock));
            EXPECT_EQ(granted ? 0 : 3, Script::Current().Calls("usleep", "7000"));
            EXPECT_EQ(granted ? "" : kBusy, Left());
            second.Unlock();
            EXPECT_TRUE(IsLocked(kStatusLock));
            first.Unlock();
            EXPECT_FALSE(IsLocked(kStatusLock));
        }
    }
}

TEST_F(ConfigLock, IsGrantedWhenTheHolderLetsGoBetweenTwoAttempts) {
    LockAgent holder(kStatusLock);
    Fail({.call = "usleep", .action = [&] { holder.Release(); }});
    Document document;
    EXPECT_TRUE(document.Lock(true));
    EXPECT_EQ(2, Script::Current().Calls("flock", kStatusLock));
    document.Unlock();
    EXPECT_EQ("", Left());
}

TEST_F(ConfigLock, IsTriedAgainOnlyWhenTriedTooEarly) {
    const struct {
        const char *name;
        Fault fault;
        int attempts;
        bool locked;
    } rows[] = {
        {"interrupted once", {.call = "flock", .error = EINTR}, 2, true},
        {"busy twice", {.call = "flock", .times = 2, .error = EAGAIN}, 3, true},
        {"interrupted always", {.call = "flock", .times = 3, .error = EINTR}, 3, false},
        {"no locks on this file system", {.call = "flock", .error = ENOLCK}, 1, false},
        {"read-only /tmp", {.call = "open", .error = EROFS}, 1, false},
        {"no descriptors left at the second attempt", {.call = "open", .nth = 2, .error = EMFILE}, 2, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Forget();
        const auto before = OpenDescriptors();
        if (row.fault.nth == 2) {
            Fail({.call = "flock", .error = EAGAIN});
        }
        Fail(row.fault);
        Document document;
        EXPECT_EQ(row.locked, document.Lock(true));
        EXPECT_EQ(row.attempts, Script::Current().Calls("open", kStatusLock));
        EXPECT_EQ(row.locked ? "" : kBusy, Left());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
        document.Unlock();
        EXPECT_EQ(before, OpenDescriptors());
    }
}

TEST_F(ConfigLock, FileIsOwnWritableClosedOnExecAndNoLink) {
    {
        const UmaskOf none(0);
        Document document;
        ASSERT_TRUE(document.Lock(true));
        EXPECT_EQ(0100644U, StatusOf(kStatusLock).st_mode);
        for (const std::string &open : OpenDescriptors()) {
            if (open.ends_with(kStatusLock)) {
                EXPECT_EQ(FD_CLOEXEC, ::fcntl(std::stoi(open), F_GETFD));
            }
        }
        document.Unlock();
    }
    const std::string target = std::string(kConfigDir) + "/elsewhere";
    fs::remove(kStatusLock);
    fs::create_symlink(target, kStatusLock);
    Document document;
    EXPECT_FALSE(document.Lock(true));
    EXPECT_EQ(kBusy, Left());
    EXPECT_FALSE(fs::exists(target));
    document.Unlock();
}

TEST_F(ConfigLock, IsNotReleasedByTheDestructorButByTheEndOfTheProcess) {
    const int child = RunInChild([] {
        {
            Document document;
            document.Lock(true);
        }
        return IsLocked(kStatusLock) ? 1 : 0;
    });
    EXPECT_EQ(1, child);
    EXPECT_FALSE(IsLocked(kStatusLock));
}

TEST_F(ConfigLock, UnlockingWhatWasNeverLockedDoesNothing) {
    Document document;
    document.Unlock();
    EXPECT_EQ(0, Script::Current().Calls("flock"));
}

TEST_F(ConfigLoad, TakesOneWholeStrictDocument) {
    const std::string bytes = "{\"\xff\xfe\":\"\xc3\"}";  // names on disk need not be UTF-8
    const struct {
        const char *name;
        std::string text;
        std::optional<std::string> document;  // none: refused
    } rows[] = {
        {"empty object", "{}", "{}"},
        {"surrounding blanks", " \n{\"a\":1}\r\n\t ", R"({"a":1})"},
        {"scalar", "5", "5"},
        {"string", R"("text")", R"("text")"},
        {"array", "[1]", "[1]"},
        {"duplicate members", R"({"a":1,"b":2,"a":3})", R"({"a":3,"b":2})"},
        {"bytes that are no UTF-8", bytes, bytes},
        {"256 levels", Nested(256), Nested(256)},
        {"257 levels", Nested(257), {}},
        {"100000 levels", std::string(100000, '['), {}},
        {"zero bytes", "", {}},
        {"only blanks", " \n", {}},
        {"cut short", R"({"a":1)", {}},
        {"trailing text", R"({"a":1} x)", {}},
        {"two documents", "{}{}", {}},
        {"line comment", "// comment\n{}", {}},
        {"comment behind", "{} /* comment */", {}},
        {"comment before a value", R"({"a": /* comment */ 1})", {}},
        {"comment at the start", R"({/*c*/"a":1})", {}},
        {"comment behind a value", R"([1/*c*/])", {}},
        {"comment behind a comma", "{\"a\":1,//c\n\"b\":2}", {}},
        {"comment behind a trailing comma", R"({"":1,/*c*/})", {}},
        {"slashes and quotes in a string", R"({"a":"//,]\\\",}/*"})", R"({"a":"//,]\\\",}/*"})"},
        {"only a minus", R"({"a":-})", {}},
        {"a plus", R"({"a":+1})", {}},
        {"leading zeros", "[-007]", {}},
        {"no digit before the point", "[.5]", {}},
        {"no digit behind the point", "[1.]", {}},
        {"no exponent", "[1e+]", {}},
        {"numbers", "[0,-0,10,-1.25e+2,1E-2,2e2]", "[0,0,10,-125.0,0.01,200.0]"},
        {"trailing comma in an object", R"({"a":1,})", {}},
        {"trailing comma in an array", "[1,]", {}},
        {"bare name", "{a:1}", {}},
        {"single quotes", "{'a':1}", {}},
        {"not a number", "[NaN]", {}},
        {"a NUL and text behind", std::string("{}\0 x", 5), {}},
        {"a number beyond all ranges", "[1e999999]", {}},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        GivenStatusConf(row.text);
        Document document;
        EXPECT_EQ(row.document.has_value(), document.Load());
        if (row.document) {
            EXPECT_EQ(*row.document, document.Text());
        }
        EXPECT_EQ(row.document ? "" : kStatusConfUnreadable, Left());
        EXPECT_EQ(row.text, ReadFile(kStatusConf));
    }
}

TEST_F(ConfigLoad, OfWhatIsNoFileLeavesTheEmptyObject) {
    const struct {
        const char *name;
        std::function<void()> plant;
        bool loaded;
    } rows[] = {
        {"nothing", [] {}, true},
        {"link to a file", [] { fs::create_symlink("elsewhere", kStatusConf); }, true},
        {"directory", [] { fs::create_directory(kStatusConf); }, true},
        {"fifo", [] { ::mkfifo(kStatusConf, 0600); }, true},
        {"no bytes", [] { GivenStatusConf(""); }, false},
        {"not to be opened",
         [] { GivenStatusConf("[1]"), Fail({.call = "open", .about = kStatusConf, .error = EACCES}); }, false},
        {"not to be looked at", [] { Fail({.call = "lstat", .about = kStatusConf, .error = EACCES}); }, false},
        {"not to be read to its end",
         [] { GivenStatusConf("[1]"), Fail({.call = "pread", .about = kStatusConf}); }, false},
        {"below a file", [] { Fail({.call = "lstat", .about = kStatusConf, .error = ENOTDIR}); }, true},
    };
    WriteFile(std::string(kConfigDir) + "/elsewhere", R"({"a":1})");
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove_all(kStatusConf);
        row.plant();
        Document document;
        EXPECT_EQ(row.loaded, document.Load());
        EXPECT_EQ("{}", document.Text());
        EXPECT_EQ(row.loaded ? "" : kStatusConfUnreadable, Left());
    }
}

TEST_F(ConfigSave, LeavesOneFileOfMode0644WhateverTheUmask) {
    for (const mode_t mask : {0U, 0022U, 0777U}) {
        const UmaskOf set(mask);
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
    for (const std::string &text : {std::string(R"({"new":"and longer than before"})"), std::string("{}"),
                                    R"({"large":")" + large + "\"}", std::string("{\"\xff\xfe\":\"\xc3\"}")}) {
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
        {"no room kept", {.call = "fallocate", .about = kStatusConf, .error = ENOSPC}, longer},
        {"nothing written", {.call = "write", .about = kStatusConf, .error = ENOSPC}, longer},
        {"interrupted", {.call = "write", .about = kStatusConf, .error = EINTR}, longer},
        {"cut while shrinking", {.call = "write", .about = kStatusConf, .result = 1}, "{}"},
        {"the end not set", {.call = "ftruncate", .about = kStatusConf, .error = EIO}, "{}"},
        {"the old bytes not to be read", {.call = "pread", .about = kStatusConf}, longer},
        {"lost at the last moment", {.call = "close", .about = kStatusConf}, longer},
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

TEST_F(ConfigSave, CutAnywhereRestoresTheOldBytesHoweverRoughTheWayBack) {
    constexpr long kSize = 153600;
    constexpr long kBlock = 4096;
    const std::string text = R"({"new":")" + std::string(kSize - 10, 'n') + "\"}";
    for (const long oldSize : {kSize / 2, kSize, kSize * 2}) {
        const std::string old = R"({"old":")" + std::string(static_cast<size_t>(oldSize) - 10, 'o') + "\"}";
        for (long done = 0; done < std::max(oldSize, kSize); done += kBlock) {
            GivenStatusConf(old);
            Fail({.call = "write", .about = kStatusConf, .result = std::max(1L, done)});
            Fail({.call = "write", .about = kStatusConf, .nth = 2, .error = EINTR});
            Fail({.call = "write", .about = kStatusConf, .nth = 3, .result = kBlock});
            ASSERT_FALSE(Document(text).Save());
            ASSERT_EQ(kStatusConfUnwritable, Left());
            ASSERT_TRUE(old == ReadFile(kStatusConf)) << oldSize << " " << done;
            ASSERT_THAT(Script::Current().Finish(), IsEmpty());
        }
    }
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
        {"for its owner alone", {{.call = "fchmod"}}, false},
        {"lost at the last moment", {{.call = "close", .about = kConfigDir}}, false},
        {"named in the second way", {nameOnce}, true},
        {"made by another meanwhile", {{.call = "linkat", .times = 2, .error = EEXIST}}, false},
        {"named from the start", {nameless}, true},
        {"named from the start in the end", {nameNever}, true},
        {"not to be named", {nameNever, {.call = "open", .about = kStatusConf, .nth = 2, .error = EEXIST}}, false},
        {"named, nothing written", {nameless, {.call = "write", .about = kConfigDir, .error = ENOSPC}}, false},
        {"named, lost at the last moment", {nameless, {.call = "close", .about = kStatusConf}}, false},
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

TEST_F(ConfigSave, ReservesTheSpaceOfALongerDocumentAsFarAsItCan) {
    for (const int error : {EINTR, EOPNOTSUPP, ENOSYS}) {
        GivenStatusConf("{}");
        Fail({.call = "fallocate", .about = kStatusConf, .error = error});
        EXPECT_TRUE(Document(R"({"longer":"than before"})").Save());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }
}

TEST_F(ConfigSave, WritesEveryKindOfValue) {
    const std::string text = R"({"a":[null,true,-1,18446744073709551615,0.5,1e+300,"\u0001\"\\\n"],"o":{}})";
    EXPECT_TRUE(Document(text).Save());
    EXPECT_EQ(Canonical(text), StatusConf());
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

TEST_F(ConfigLoad, GetsTheWholeFileWhateverComesInBetween) {
    const auto replace = [] { GivenStatusConf(R"({"whole":true,"longer":"than before"})"); };
    const struct {
        const char *name;
        Fault fault;
        bool held;
        const char *document;
    } rows[] = {
        {"interrupted", {.call = "pread", .error = EINTR}, false, R"({"a":1})"},
        {"growing", {.call = "pread", .action = replace}, false, R"({"longer":"than before","whole":true})"},
        {"held by a stranger", {.call = "none"}, true, R"({"a":1})"},
        {"held, and growing behind the reader",
         {.call = "pread", .nth = 3, .action = replace},
         true,
         R"({"longer":"than before","whole":true})"},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        GivenStatusConf("{}");
        std::optional<LockAgent> stranger;
        if (row.held) {
            stranger.emplace(kStatusConf);
        }
        EXPECT_TRUE(Document(R"({"a":1})").Save());
        Fail(row.fault);
        Document document;
        EXPECT_TRUE(document.Load());
        EXPECT_EQ(row.document, document.Text());
        Script::Current().Finish();
    }
}

}  // namespace
}  // namespace fileindex_test
