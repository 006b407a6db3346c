// What programs that are linked with the library rely on. The layout, sizes and places of members and slots of
// virtual functions, was compiled into them: a change of it needs a new SONAME.
#include "fixture.h"

#include <cstddef>
#include <cstring>
#include <map>
#include <string>

namespace fileindex_test {
namespace {

const _tag_fileindex_err_ kErrorAtStart = ErrorHandler::GetError();
const int kLogLevelAtStart = LOG_LEVEL;

class Interface : public FileIndexTest {};

/// A pointer to a virtual member function holds the place of its slot in the table, plus one.
template <typename Member>
std::ptrdiff_t SlotOf(Member member) {
    std::ptrdiff_t place = 0;
    std::memcpy(&place, &member, sizeof(place));
    return (place - 1) / static_cast<std::ptrdiff_t>(sizeof(void *));
}

TEST_F(Interface, KeepsTheLayoutOfTheFolderRecord) {
    constexpr size_t kString = sizeof(std::string);
    const Folder folder;
    EXPECT_EQ(3 * kString + 8, sizeof(Folder));
    const auto *const begin = reinterpret_cast<const char *>(&folder);
    const void *const members[] = {&folder.path,  &folder.name,  &folder.document,
                                   &folder.audio, &folder.video, &folder.photo};
    const size_t places[] = {kString, 2 * kString, 3 * kString, 3 * kString + 1, 3 * kString + 2, 3 * kString + 3};
    for (size_t i = 0; i < std::size(members); ++i) {
        EXPECT_EQ(begin + places[i], members[i]) << i;
    }
}

TEST_F(Interface, KeepsTheLayoutOfTheConfigurationClasses) {
    EXPECT_EQ(sizeof(void *) + sizeof(Json::Value) + 8, sizeof(Config));
    EXPECT_EQ(sizeof(Config), sizeof(Status));
    EXPECT_EQ(sizeof(Config) + sizeof(std::map<std::string, Folder>), sizeof(Folders));
    // The two destructors come first.
    EXPECT_EQ(2, SlotOf(&Config::Load));
    EXPECT_EQ(3, SlotOf(&Config::Save));
    EXPECT_EQ(4, SlotOf(&Config::GetLockPath));
    EXPECT_EQ(5, SlotOf(&Config::GetPath));
}

TEST_F(Interface, KeepsTheErrorCodes) {
    EXPECT_EQ(4U, sizeof(ErrorHandler::g_error_code));
    EXPECT_EQ(4U, sizeof(LOG_LEVEL));
    const int codes[] = {FILEINDEX_ERR_NONE,      FILEINDEX_ERR_BAD_PARAM,      FILEINDEX_ERR_PATH,
                         FILEINDEX_ERR_RESERVED,  FILEINDEX_ERR_NO_SUCH_FOLDER, FILEINDEX_ERR_EXCEED_MAX_FOLDER,
                         FILEINDEX_ERR_LOAD_JSON, FILEINDEX_ERR_SAVE_JSON,      FILEINDEX_ERR_MALFORMED_CONFIG,
                         FILEINDEX_ERR_LOCK};
    for (int value = 0; value < static_cast<int>(std::size(codes)); ++value) {
        EXPECT_EQ(value, codes[value]);
    }
    EXPECT_EQ(FILEINDEX_ERR_NONE, kErrorAtStart);
    EXPECT_EQ(3, kLogLevelAtStart);
}

TEST_F(Interface, KeepsAnErrorCodeThroughASuccessAndWhateverTheLogLevel) {
    std::string full;
    for (const int level : {0, 3, 7}) {
        LOG_LEVEL = level;
        ASSERT_FALSE(GetFullPath(full, "/none/x") || GetFullPath(full, ""));
        ASSERT_TRUE(GetFullPath(full, "/photo/x"));
        EXPECT_EQ(FILEINDEX_ERR_PATH, ErrorHandler::g_error_code);
        EXPECT_EQ("PATH; utils.cpp:389 GetShareNameByPath failed, path=", Left());
    }
    EXPECT_EQ(0,
              FILEIDXIsPathIndexed(nullptr) + FILEIDXIsFullPathIndexed(nullptr) + FILEIDXIsShareIndexed(nullptr));
    EXPECT_FALSE(CanShareBeIndexed(nullptr));
    EXPECT_EQ("", Left());
}

}  // namespace
}  // namespace fileindex_test
