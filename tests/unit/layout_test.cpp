// What programs that are linked with the library were compiled with: sizes, places of members, slots of virtual
// functions. A change of these needs a new SONAME.
#include <fileindex/fileindex.h>

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <map>
#include <string>

namespace fileindex_test {
namespace {

using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every test

/// A pointer to a virtual member function holds the place of its slot in the table, plus one.
template <typename Member>
std::ptrdiff_t SlotOf(Member member) {
    std::ptrdiff_t place = 0;
    static_assert(sizeof(member) >= sizeof(place));
    std::memcpy(&place, &member, sizeof(place));
    return (place - 1) / static_cast<std::ptrdiff_t>(sizeof(void *));
}

size_t PlaceIn(const Folder &folder, const void *member) {
    return reinterpret_cast<std::uintptr_t>(member) - reinterpret_cast<std::uintptr_t>(&folder);
}

TEST(Layout, OfTheFolderRecord) {
    constexpr size_t kString = sizeof(std::string);
    const Folder folder;
    EXPECT_EQ(3 * kString + 8, sizeof(Folder));
    const void *const members[] = {&folder.path,  &folder.name,  &folder.document,
                                   &folder.audio, &folder.video, &folder.photo};
    const size_t places[] = {kString, 2 * kString, 3 * kString, 3 * kString + 1, 3 * kString + 2, 3 * kString + 3};
    for (size_t i = 0; i < std::size(members); ++i) {
        EXPECT_EQ(places[i], PlaceIn(folder, members[i])) << i;
    }
}

TEST(Layout, OfTheConfigurationClasses) {
    EXPECT_EQ(sizeof(void *) + sizeof(Json::Value) + 8, sizeof(Config));
    EXPECT_EQ(sizeof(Config), sizeof(Status));
    EXPECT_EQ(sizeof(Config) + sizeof(std::map<std::string, Folder>), sizeof(Folders));
    // The two destructors come first.
    EXPECT_EQ(2, SlotOf(&Config::Load));
    EXPECT_EQ(3, SlotOf(&Config::Save));
    EXPECT_EQ(4, SlotOf(&Config::GetLockPath));
    EXPECT_EQ(5, SlotOf(&Config::GetPath));
}

TEST(Layout, OfErrorCodesAndTheLogLevel) {
    EXPECT_EQ(4U, sizeof(ErrorHandler::g_error_code));
    EXPECT_EQ(4U, sizeof(LOG_LEVEL));
    const int codes[] = {FILEINDEX_ERR_NONE,      FILEINDEX_ERR_BAD_PARAM,      FILEINDEX_ERR_PATH,
                         FILEINDEX_ERR_RESERVED,  FILEINDEX_ERR_NO_SUCH_FOLDER, FILEINDEX_ERR_EXCEED_MAX_FOLDER,
                         FILEINDEX_ERR_LOAD_JSON, FILEINDEX_ERR_SAVE_JSON,      FILEINDEX_ERR_MALFORMED_CONFIG,
                         FILEINDEX_ERR_LOCK};
    for (int value = 0; value < static_cast<int>(std::size(codes)); ++value) {
        EXPECT_EQ(value, codes[value]);
    }
}

}  // namespace
}  // namespace fileindex_test
