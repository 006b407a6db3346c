// What counts as a configuration, and how it is read beside writers.
#include "fixture.h"

#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

std::string Nested(size_t depth) {
    return std::string(depth, '[') + std::string(depth, ']');
}

class ConfigLoad : public FileIndexTest {};

TEST_F(ConfigLoad, TakesAnyBytesAndSoManyLevels) {
    const std::string bytes = "{\"\xff\xfe\":\"\xc3\"}";  // names on disk need not be UTF-8
    for (const std::string &text : {bytes, Nested(256)}) {
        GivenStatusConf(text);
        Document document;
        EXPECT_TRUE(document.Load());
        EXPECT_EQ(text, document.Text());
    }
    for (const std::string &text : {Nested(257), std::string(100000, '[')}) {
        GivenStatusConf(text);
        EXPECT_FALSE(Document().Load());
        EXPECT_EQ(kStatusConfUnreadable, Left());
    }
}

TEST_F(ConfigLoad, OfFoldersRefusesAByteOrderMark) {
    GivenFolderConf("\xef\xbb\xbf{}");
    std::vector<Folder> folders;
    EXPECT_FALSE(IndexMgr::List(folders));
    EXPECT_EQ(std::string("6 config.cpp Failed to load json from ") + kFolderConf, Left());
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
