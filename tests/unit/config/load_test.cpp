// What counts as a configuration, and how it is read beside writers.
#include "unit/config/document.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <optional>
#include <string>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

std::string Nested(size_t depth) {
    return std::string(depth, '[') + std::string(depth, ']');
}

class ConfigLoad : public FileIndexTest {};

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
