// The error code, the log level, and what no line of a transcript can hold.
#include "fixture.h"

#include <string>

namespace fileindex_test {
namespace {

const _tag_fileindex_err_ kErrorAtStart = ErrorHandler::GetError();
const int kLogLevelAtStart = LOG_LEVEL;

class ErrorState : public FileIndexTest {};

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

TEST_F(ErrorState, IsNoneAfterANullPointer) {
    EXPECT_EQ(0, FILEIDXIsPathIndexed(nullptr));
    EXPECT_EQ(0, FILEIDXIsFullPathIndexed(nullptr));
    EXPECT_EQ(0, FILEIDXIsShareIndexed(nullptr));
    EXPECT_FALSE(CanShareBeIndexed(nullptr));
    EXPECT_EQ("", Left());
}

}  // namespace
}  // namespace fileindex_test
