// The error code, the log level, reading members of JSON objects, and the small path functions.
#include "fixture.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

const _tag_fileindex_err_ kErrorAtStart = ErrorHandler::GetError();
const int kLogLevelAtStart = LOG_LEVEL;

class ErrorState : public FileIndexTest {};
class JsonAccess : public FileIndexTest {};
class Paths : public FileIndexTest {};

TEST_F(ErrorState, IsNoneWhenTheLibraryIsLoadedAndOutlivesASuccess) {
    EXPECT_EQ(FILEINDEX_ERR_NONE, kErrorAtStart);
    EXPECT_EQ(3, kLogLevelAtStart);

    GivenShare("photo");
    std::string full;
    ASSERT_FALSE(GetFullPath(full, "/none/x"));
    ASSERT_TRUE(GetFullPath(full, "/photo/x"));
    EXPECT_EQ(FILEINDEX_ERR_PATH, ErrorHandler::GetError());
    EXPECT_EQ(FILEINDEX_ERR_PATH, ErrorHandler::g_error_code);
}

TEST_F(ErrorState, TheLogLevelDoesNotSelectTheRecords) {
    for (const int level : {0, 3, 7}) {
        LOG_LEVEL = level;
        std::string full;
        EXPECT_FALSE(GetFullPath(full, ""));
        EXPECT_EQ("0 utils.cpp:389 GetShareNameByPath failed, path=", Left());
    }
}

TEST_F(JsonAccess, TakesOnlyMembersOfTheRightType) {
    const struct {
        const char *object;
        bool isString, isBool;
    } rows[] = {
        {R"({"key": "text"})", true, false},
        {R"({"key": ""})", true, false},
        {R"({"key": true})", false, true},
        {R"({"key": false})", false, true},
        {R"({"key": 1})", false, false},
        {R"({"key": 0})", false, false},
        {R"({"key": 5.5})", false, false},
        {R"({"key": null})", false, false},
        {R"({"key": ["a"]})", false, false},
        {R"({"Key": "text"})", false, false},
        {R"({})", false, false},
        {R"(["key"])", false, false},
        {R"("key")", false, false},
        {"null", false, false},
        {"7", false, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.object);
        const Json::Value object = Parse(row.object);
        std::string text = "before";
        EXPECT_EQ(row.isString, RetrieveStringFromJsonObj(text, "key", object));
        EXPECT_EQ(row.isString ? object["key"].asString() : "before", text);
        for (const bool before : {false, true}) {
            bool flag = before;
            EXPECT_EQ(row.isBool, RetrieveBoolFromJsonObj(flag, "key", object));
            EXPECT_EQ(row.isBool ? object["key"].asBool() : before, flag);
        }
    }
    EXPECT_EQ("", Left());
}

TEST_F(Paths, TheShareNameIsTheFirstComponent) {
    const struct {
        const char *path;
        bool result;
        const char *share;
    } rows[] = {
        {"/media/photos/trip", true, "media"},
        {"/media", true, "media"},
        {"/media/", true, "media"},
        {"/", true, ""},
        {"//a", true, ""},
        {"share/x", true, "hare"},
        {"", false, "before"},
    };
    for (const auto &row : rows) {
        std::string share = "before";
        EXPECT_EQ(row.result, GetShareNameByPath(share, row.path)) << row.path;
        EXPECT_EQ(row.share, share) << row.path;
    }
    EXPECT_EQ("", Left());
}

TEST_F(Paths, AFullPathIsTheDirectoryAboveTheSharesAndTheSharePathUnchanged) {
    auto &shares = Platform::Current().shares;
    shares["media"].path = "/vol1/media";
    shares["deep"].path = "/vol2/a/b/deep";
    shares["renamed"].path = "/vol2/other";
    shares["top"].path = "/top";
    shares["flat"].path = "flat";
    const struct {
        const char *path, *full;
    } rows[] = {
        {"/media/photos", "/vol1/media/photos"},
        {"/media", "/vol1/media"},
        {"/media/", "/vol1/media/"},
        {"/media/../x//y", "/vol1/media/../x//y"},
        {"/deep/x", "/vol2/a/b/deep/x"},
        {"/renamed/x", "/vol2/renamed/x"},
        {"/top/x", "/top/x"},
        {"/flat/x", "flat/flat/x"},
        {"_media/x", "/vol1_media/x"},
    };
    for (const auto &row : rows) {
        std::string full;
        EXPECT_TRUE(GetFullPath(full, row.path)) << row.path;
        EXPECT_EQ(row.full, full);
    }
}

TEST_F(Paths, WhatCannotBeResolvedLeavesItsReasonAndTheOutput) {
    GivenShare("photo");
    std::string out = "before";
    std::string path = "before";
    EXPECT_FALSE(GetFullPath(out, "/none/x"));
    EXPECT_EQ("2", Left());
    Fail({.call = "VORKShareGet", .result = 0});  // claims success and brings no record
    EXPECT_FALSE(GetFullPath(out, "/photo/x"));
    EXPECT_EQ("2", Left());
    Platform::Current().shares["nowhere"].path = "";
    for (const std::string &unreal : {std::string("/nowhere/x"), std::string("/photo\0/x", 9)}) {
        EXPECT_FALSE(GetFullPath(out, unreal));
        EXPECT_EQ("2", Left());
    }
    Platform::Current().shares.erase("nowhere");
    EXPECT_FALSE(GetFullPath(out, ""));
    EXPECT_EQ("0 utils.cpp:389 GetShareNameByPath failed, path=", Left());
    for (const std::string &outside : {std::string("/vol9/x"), std::string("/vol1/photo\0/x", 14)}) {
        EXPECT_FALSE(GetShareNamePathByFullPath(out, path, outside));
        EXPECT_EQ(std::string("2 utils.cpp:418 VORKShareNamePathGet failed, path=") + outside.c_str(), Left());
    }
    EXPECT_EQ("before before", out + " " + path);

    EXPECT_TRUE(GetShareNamePathByFullPath(out, path, "/vol1/photo/a"));
    EXPECT_EQ("photo /vol1/photo", out + " " + path);
}

TEST_F(Paths, TheShareNameIsReplacedAndTheRestKept) {
    const struct {
        const char *path, *replaced;
    } rows[] = {{"/old/a/b", "/new/a/b"}, {"/old", "/new"}, {"/a/", "/new/"}, {"", ""},
                {"xold/a", "/new/a"},     {"/", "/new"},    {"//a", "/new/a"}};
    for (const auto &row : rows) {
        EXPECT_EQ(row.replaced, ReplaceShareName(row.path, "new")) << row.path;
    }
}

TEST_F(Paths, PrefixesAreBytes) {
    EXPECT_TRUE(StringStartWith("/photo/a", "/photo"));
    EXPECT_TRUE(StringStartWith("/photo", "/photo"));
    EXPECT_TRUE(StringStartWith("", ""));
    EXPECT_TRUE(StringStartWith("/photo", ""));
    EXPECT_FALSE(StringStartWith("/phot", "/photo"));
    EXPECT_FALSE(StringStartWith("/Photo/a", "/photo"));
    EXPECT_TRUE(StringStartWith(std::string("a\0b", 3), std::string("a\0", 2)));
    EXPECT_FALSE(StringStartWith(std::string("a\0b", 3), std::string("a\0c", 3)));
}

TEST_F(Paths, FilesAndDirectoriesAreSeenWithoutFollowingLinks) {
    const std::string base = std::string(kConfigDir) + "/";
    WriteFile(base + "file", "");
    fs::create_directory(base + "dir");
    fs::create_symlink("file", base + "to-file");
    fs::create_symlink("dir", base + "to-dir");
    ASSERT_EQ(0, ::mkfifo((base + "fifo").c_str(), 0600));
    const struct {
        const char *name;
        bool isFile, isDir;
    } rows[] = {{"file", true, false},    {"dir", false, true},   {"to-file", false, false},
                {"to-dir", false, false}, {"fifo", false, false}, {"none", false, false}};
    for (const auto &row : rows) {
        EXPECT_EQ(row.isFile, IsFileExist(base + row.name)) << row.name;
        EXPECT_EQ(row.isDir, IsDirExist(base + row.name)) << row.name;
    }
    EXPECT_FALSE(IsFileExist(base + std::string("file\0x", 6)) || IsDirExist(base + std::string("dir\0x", 5)));
    Fail({.call = "lstat", .times = 2, .error = EACCES});
    EXPECT_FALSE(IsFileExist(base + "file"));
    EXPECT_FALSE(IsDirExist(base + "dir"));
}

}  // namespace
}  // namespace fileindex_test
