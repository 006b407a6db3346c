// Shares from the platform's own file.
#include "support.h"

#include <vork/share.h>

#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <atomic>
#include <cstdarg>
#include <cstring>

using platform_test::kConfiguration;
using platform_test::WriteFile;

namespace {

std::atomic<int> configurationReads{0};

}  // namespace

// Stands before the C library's and counts how often the configuration is read.
extern "C" int open(const char *path, int flags, ...) {
    va_list rest;
    va_start(rest, flags);
    const mode_t mode = (flags & (O_CREAT | O_TMPFILE)) != 0 ? va_arg(rest, mode_t) : 0;
    va_end(rest);
    if (path == kConfiguration) {
        ++configurationReads;
    }
    static const auto real = reinterpret_cast<int (*)(const char *, int, ...)>(dlsym(RTLD_NEXT, "open"));
    return real(path, flags, mode);
}

namespace {

// The directory of the share; "error N" when the lookup fails; what must hold for every lookup is checked.
std::string PathOf(const std::string &name) {
    VORKSHARE *share = nullptr;
    if (VORKShareGet(name.c_str(), &share) < 0) {
        EXPECT_EQ(share, nullptr);
        char code[32];
        std::snprintf(code, sizeof code, "error 0x%04X", static_cast<unsigned int>(VLIBCErrGet()));
        return code;
    }
    EXPECT_EQ(share->szName, name);
    std::string path = share->szPath;
    VORKShareFree(share);
    return path;
}

// The name and directory of the share that holds the path.
std::string HolderOf(const std::string &fullPath) {
    char name[492] = "";
    char path[4096] = "";
    if (VORKShareNamePathGet(fullPath.c_str(), name, sizeof name, path, sizeof path) < 0) {
        return "none";
    }
    return std::string(name) + " " + path;
}

class SharesTest : public testing::Test {
protected:
    void SetUp() override { std::filesystem::remove_all(kConfiguration); }

    static void Configure(const std::string &shares) { WriteFile(kConfiguration, "{\"shares\": " + shares + "}"); }
};

constexpr const char *kMalformed = "error 0x0B00";
constexpr const char *kBadParameter = "error 0x0D00";
constexpr const char *kNoSuchShare = "error 0x1400";
constexpr const char *kOtherName = "error 0x1401";

TEST_F(SharesTest, LooksUpByName) {
    Configure(R"({
        "photo": {"path": "/vol1/photo"}, "slash": {"path": "/vol1/slash//"}, "two words": {"path": "/v 1/two words"},
        "Photo": {"path": "/vol2/Photo"}, "caf\u00e9": {"path": "/vol1/café"},
        "music": {"path": "/vol1/Music"}, "moved": {"path": "/vol1/other"}, "top": {"path": "/"},
        "relative": {"path": "vol1/relative"}, "dots": {"path": "/vol1/../dots"}, "double": {"path": "/vol1//double"},
        "nul": {"path": "/vol1\u0000/nul"}, "pathless": {}, "number": {"path": 7}, "text": "/vol1/text",
        "bin": {"path": "/vol1/bin", "recycle": "/absolute"}, "snap": {"path": "/vol1/snap", "snapshot": true},
        "a/b": {"path": "/vol1/a/b"}, "..": {"path": "/vol1/.."}, "": {"path": "/vol1/"}})");
    const struct {
        const char *name, *expected;
    } rows[] = {
        {"photo", "/vol1/photo"},  {"slash", "/vol1/slash"}, {"two words", "/v 1/two words"},
        {"Photo", "/vol2/Photo"},  {"café", "/vol1/café"},   {"PHOTO", kNoSuchShare},
        {"caf\xC3", kNoSuchShare}, {"music", kOtherName},    {"moved", kOtherName},
        {"top", kMalformed},       {"relative", kMalformed}, {"dots", kMalformed},
        {"double", kMalformed},    {"nul", kMalformed},      {"pathless", kMalformed},
        {"number", kMalformed},    {"text", kMalformed},     {"bin", kMalformed},
        {"snap", kMalformed},      {"a/b", kBadParameter},   {"..", kBadParameter},
        {".", kBadParameter},      {"", kBadParameter},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(PathOf(row.name), row.expected) << row.name;
    }
}

TEST_F(SharesTest, FindsTheInnermostShareThatHoldsAPath) {
    Configure(R"({"photo": {"path": "/vol1/photo"}, "trip": {"path": "/vol1/photo/2015/trip"},
                  "wrong": {"path": "/vol1/photo/other"}})");
    const struct {
        const char *path, *expected;
    } rows[] = {
        {"/vol1/photo", "photo /vol1/photo"},
        {"/vol1/photo/", "photo /vol1/photo"},
        {"/vol1/photo/2015", "photo /vol1/photo"},
        {"/vol1/photo/2015/trip", "trip /vol1/photo/2015/trip"},
        {"/vol1/photo/2015/trip/a/b", "trip /vol1/photo/2015/trip"},
        {"/vol1/photo/2015/trips", "photo /vol1/photo"},
        {"/vol1/photo/other/x", "photo /vol1/photo"},
        {"/vol1/photos", "none"},
        {"/vol1/Photo", "none"},
        {"/vol1", "none"},
        {"/", "none"},
        {"", "none"},
        {"vol1/photo", "none"},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(HolderOf(row.path), row.expected) << row.path;
    }
}

TEST_F(SharesTest, RefusesBuffersThatAreTooShort) {
    Configure(R"({"photo": {"path": "/vol1/photo"}})");
    const struct {
        int nameSize, pathSize;
        bool fits;
    } rows[] = {{6, 12, true}, {5, 12, false}, {6, 11, false}, {0, 12, false}, {-1, 12, false}, {6, -1, false}};
    for (const auto &row : rows) {
        char name[16];
        char path[16];
        std::memset(name, '#', sizeof name);
        std::memset(path, '#', sizeof path);
        const int result = VORKShareNamePathGet("/vol1/photo/x", name, row.nameSize, path, row.pathSize);
        EXPECT_EQ(result == 0, row.fits) << row.nameSize << " " << row.pathSize;
        EXPECT_EQ(name[row.fits ? 6 : 15], '#') << "written beyond its end";
        EXPECT_EQ(path[row.fits ? 12 : 15], '#') << "written beyond its end";
    }
}

TEST_F(SharesTest, KnowsRecycleBins) {
    Configure(R"({"photo": {"path": "/vol1/photo"}, "music": {"path": "/vol1/music", "recycle": "old/bin"},
                  "none": {"path": "/vol1/none", "recycle": ""}, "inner": {"path": "/vol1/photo/#recycle/inner"}})");
    const struct {
        const char *path;
        bool inBin;
    } rows[] = {
        {"/vol1/photo/#recycle", true},   {"/vol1/photo/#recycle/a/b", true},
        {"/vol1/photo/#recycled", false}, {"/vol1/photo/2015/#recycle", false},
        {"/vol1/music/#recycle", false},  {"/vol1/music/old/bin/x", true},
        {"/vol1/music/old", false},       {"/vol1/none/#recycle", false},
        {"/vol1/none/", false},           {"/vol1/photo/#recycle/inner/x", true},
        {"/vol2/photo/#recycle", false},  {"#recycle", false},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(VORKShareIsShareRecycle(row.path) != 0, row.inBin) << row.path;
    }
}

TEST_F(SharesTest, ReadsTheDocumentedExample) {
    WriteFile(kConfiguration, platform_test::DocumentedExample("\"shares\""));
    EXPECT_EQ(PathOf("photo"), "/vol1/photo");
    EXPECT_EQ(PathOf("music"), "/vol2/music");
    EXPECT_NE(VORKShareIsShareRecycle("/vol1/photo/#recycle/x"), 0);
    EXPECT_EQ(VORKShareIsShareRecycle("/vol2/music/#recycle/x"), 0);
}

TEST_F(SharesTest, KeepsTheLastGoodTableWhenTheFileBreaks) {
    EXPECT_EQ(PathOf("photo"), kNoSuchShare) << "no file";
    for (const char *text :
         {"", "{", "[]", "{\"shares\": []}", "{} trailing", "{\"shares\": {\"a\": 1, \"a\": 2}}"}) {
        Configure(R"({"photo": {"path": "/vol1/photo"}})");
        EXPECT_EQ(PathOf("photo"), "/vol1/photo");
        WriteFile(kConfiguration, text);
        VLIBCErrSetEx(0, "", 0);
        EXPECT_EQ(PathOf("photo"), "/vol1/photo") << text;
        EXPECT_EQ(VLIBCErrGet(), VORK_ERR_MALFORMED) << text;
        EXPECT_EQ(PathOf("unheard"), kMalformed) << text;
        EXPECT_EQ(HolderOf("/vol1/photo/x"), "photo /vol1/photo") << text;
    }
    std::filesystem::remove(kConfiguration);
    EXPECT_EQ(PathOf("photo"), kNoSuchShare) << "a missing file means no shares, not the last ones";
}

// A directory in the file's place cannot be read at all.
TEST_F(SharesTest, TellsAnUnreadableFileFromAMissingOne) {
    std::filesystem::create_directories(kConfiguration);
    EXPECT_EQ(PathOf("photo"), "error 0x0900");
    std::filesystem::remove(kConfiguration);
    Configure(R"({"photo": {"path": "/vol1/photo"}})");
    EXPECT_EQ(PathOf("photo"), "/vol1/photo");
}

// Same size, same inode, times that the clock cannot tell apart: the hardest change to notice.
TEST_F(SharesTest, SeesEveryChangeAtOnce) {
    for (int i = 0; i < 500; ++i) {
        const std::string volume = "/vol" + std::to_string(100 + i);
        Configure("{\"photo\": {\"path\": \"" + volume + "/photo\"}}");
        ASSERT_EQ(PathOf("photo"), volume + "/photo");
    }
}

TEST_F(SharesTest, ReadsTheFileOnceForAThousandShares) {
    std::string shares = "{";
    for (int i = 0; i < 1000; ++i) {
        const std::string name = "share" + std::to_string(i);
        shares.append(i == 0 ? "\"" : ",\"")
            .append(name)
            .append("\": {\"path\": \"/vol1/")
            .append(name)
            .append("\"}");
    }
    Configure(shares + "}");
    // A file just written is read again until its times can be told from the next change's.
    int before = -1;
    while (before != configurationReads) {
        before = configurationReads;
        ASSERT_LT(before, 5000) << "read again and again";
        ASSERT_EQ(PathOf("share0"), "/vol1/share0");
    }
    for (int i = 0; i < 1000; ++i) {
        const std::string name = "share" + std::to_string(i);
        const std::string path = "/vol1/" + name;
        ASSERT_EQ(PathOf(name), path);
        ASSERT_EQ(HolderOf(path + "/x"), std::string(name).append(" ").append(path));
    }
    EXPECT_EQ(configurationReads, before);
}

TEST(NullArguments, AreRefused) {
    VORKSHARE *share = nullptr;
    char buffer[8];
    EXPECT_LT(VORKShareGet(nullptr, &share), 0);
    EXPECT_LT(VORKShareGet("photo", nullptr), 0);
    EXPECT_LT(VORKShareNamePathGet(nullptr, buffer, 8, buffer, 8), 0);
    EXPECT_LT(VORKShareNamePathGet("/vol1", nullptr, 8, buffer, 8), 0);
    EXPECT_EQ(VORKShareIsShareRecycle(nullptr), 0);
    VORKShareFree(nullptr);
}

}  // namespace
