// What counts as a configuration, and how it is read beside writers.
#include "fixture.h"

#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <functional>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

std::string Nested(size_t depth) {
    return Times(depth, "[") + Times(depth, "]");
}

class ConfigLoad : public FileIndexTest {
protected:
    static std::string Loaded() {
        Document document;
        const std::string answer = document.Load() ? "" : "no, ";
        const std::string left = Left();
        EXPECT_EQ(answer.empty() ? "" : kStatusConfUnreadable, left);
        return answer + document.Text();
    }
};

TEST_F(ConfigLoad, TakesAnyBytesAndSoManyLevels) {
    for (const std::string &text : {std::string("{\"\xff\xfe\":\"\xc3\"}"), Nested(256)}) {
        GivenStatusConf(text);
        EXPECT_EQ(text, Loaded());
    }
    for (const std::string &text : {Nested(257), Times(100000, "[")}) {
        GivenStatusConf(text);
        EXPECT_FALSE(Document().Load());
        EXPECT_EQ(kStatusConfUnreadable, Left());
    }
    GivenFolderConf("\xef\xbb\xbf{}");  // has a reader of its own
    EXPECT_EQ("no; LOAD_JSON; config.cpp Failed to load json from " + std::string(kFolderConf),
              AskAlone("Folders::Save"));
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
        {"below a file", [] { Fail({.call = "lstat", .about = kStatusConf, .error = ENOTDIR}); }, true},
        {"no bytes", [] { GivenStatusConf(""); }, false},
        {"not to be looked at", [] { Fail({.call = "lstat", .about = kStatusConf, .error = EACCES}); }, false},
        {"not to be opened", [] { GivenStatusConf("[1]"), Fail({.call = "open", .about = kStatusConf}); }, false},
        {"not to be read", [] { GivenStatusConf("[1]"), Fail({.call = "pread", .about = kStatusConf}); }, false},
    };
    WriteFile(std::string(kConfigDir) + "/elsewhere", R"({"a":1})");
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        fs::remove_all(kStatusConf);
        row.plant();
        EXPECT_EQ(row.loaded ? "{}" : "no, {}", Loaded());
    }
}

TEST_F(ConfigLoad, GetsTheWholeFileWhateverComesInBetween) {
    const std::string longer = R"({"longer":"than before","whole":true})";
    const auto replace = [&] { GivenStatusConf(longer); };
    GivenStatusConf(R"({"a":1})");
    Fail({.call = "pread", .error = EINTR});
    Fail({.call = "flock", .about = kStatusConf, .error = EINTR});
    EXPECT_EQ(R"({"a":1})", Loaded());
    EXPECT_EQ(2, Calls("flock", kStatusConf));
    Fail({.call = "pread", .action = replace});
    EXPECT_EQ(longer, Loaded());

    GivenStatusConf(R"({"a":1})");
    const LockAgent stranger(kStatusConf);  // keeps nobody out
    EXPECT_TRUE(Document(R"({"b":1})").Save());
    EXPECT_EQ(R"({"b":1})", Loaded());
    Fail({.call = "pread", .nth = 3, .action = replace});  // after it was read, before it was read again
    EXPECT_EQ(longer, Loaded());
}

}  // namespace
}  // namespace fileindex_test
