// The search setting in the platform's own file.
#include "support.h"

#include <vork/search.h>
#include <vork/share.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

using platform_test::Fork;
using platform_test::kConfiguration;
using platform_test::Parse;
using platform_test::ReadText;
using platform_test::WriteFile;

namespace {

class SearchSettingTest : public testing::Test {
protected:
    void SetUp() override { std::filesystem::remove_all(kConfiguration); }
};

TEST_F(SearchSettingTest, IsReadFromTheFile) {
    EXPECT_EQ(VORKSMBIsEnableSpotlight(), 0) << "no file";
    const struct {
        const char *text;
        bool on;
    } rows[] = {
        {R"({"search": true})", true},
        {R"({"search": false})", false},
        {"{}", false},
        {R"({"search": "on"})", false},
        {R"({"search": 1})", false},
        {R"({"search": null})", false},
        {R"({"search": true)", false},
        {"", false},
        {"[true]", false},
    };
    for (const auto &row : rows) {
        WriteFile(kConfiguration, row.text);
        EXPECT_EQ(VORKSMBIsEnableSpotlight() != 0, row.on) << row.text;
    }
}

TEST_F(SearchSettingTest, ChangesNothingElse) {
    const std::string document = R"({"other": [1, 2.5, {"x": null}], "search": false,
        "shares": {"caf\u00e9": {"path": "/vol1/café"}, "photo": {"path": "/vol1/photo", "comment": "a\/b"}}})";
    WriteFile(kConfiguration, document);
    ASSERT_EQ(chmod(kConfiguration.c_str(), 0640), 0);
    ASSERT_EQ(chown(kConfiguration.c_str(), 12, 34), 0);
    ASSERT_EQ(VORKSMBSetSpotlight(1), 0);
    EXPECT_NE(VORKSMBIsEnableSpotlight(), 0);
    Json::Value expected = Parse(document);
    expected["search"] = true;
    EXPECT_EQ(Parse(ReadText(kConfiguration)), expected);
    struct stat status {};
    ASSERT_EQ(stat(kConfiguration.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0640U);
    EXPECT_EQ(status.st_uid, 12U);
    EXPECT_EQ(status.st_gid, 34U);
    VORKSHARE *share = nullptr;
    ASSERT_EQ(VORKShareGet("café", &share), 0);
    VORKShareFree(share);
    ASSERT_EQ(VORKSMBSetSpotlight(0), 0);
    EXPECT_EQ(VORKSMBIsEnableSpotlight(), 0);
}

TEST_F(SearchSettingTest, MakesTheFileAndFollowsALink) {
    ASSERT_EQ(VORKSMBSetSpotlight(1), 0);
    EXPECT_NE(VORKSMBIsEnableSpotlight(), 0);
    std::filesystem::rename(kConfiguration, "/usr/vork/etc/real.conf");
    std::filesystem::create_symlink("/usr/vork/etc/real.conf", kConfiguration);
    ASSERT_EQ(VORKSMBSetSpotlight(0), 0);
    EXPECT_TRUE(std::filesystem::is_symlink(kConfiguration));
    EXPECT_EQ(Parse(ReadText("/usr/vork/etc/real.conf"))["search"], false);
}

TEST_F(SearchSettingTest, LeavesABrokenFileAlone) {
    WriteFile(kConfiguration, "{broken");
    EXPECT_LT(VORKSMBSetSpotlight(1), 0);
    EXPECT_EQ(VLIBCErrGet(), VORK_ERR_MALFORMED);
    EXPECT_EQ(ReadText(kConfiguration), "{broken");
}

TEST_F(SearchSettingTest, GivesUpOnALockThatOthersKeep) {
    WriteFile(kConfiguration, "{}");
    const int lock = open((kConfiguration + ".lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    ASSERT_EQ(flock(lock, LOCK_EX), 0);
    EXPECT_LT(VORKSMBSetSpotlight(1), 0);
    EXPECT_EQ(VLIBCErrGet(), VORK_ERR_TIMEOUT);
    EXPECT_EQ(ReadText(kConfiguration), "{}");
    close(lock);
    EXPECT_EQ(VORKSMBSetSpotlight(1), 0);
}

// Readers never see a file half written or missing.
TEST_F(SearchSettingTest, IsChangedInOneStep) {
    WriteFile(kConfiguration, R"({"shares": {"photo": {"path": "/vol1/photo"}}})");
    const pid_t writer = Fork([] {
        for (int i = 0; i < 300; ++i) {
            if (VORKSMBSetSpotlight(i % 2) != 0) {
                return 1;
            }
        }
        return 0;
    });
    int status = 0;
    while (waitpid(writer, &status, WNOHANG) == 0) {
        const std::string text = ReadText(kConfiguration);
        ASSERT_TRUE(Parse(text)["shares"].isMember("photo")) << text;
    }
    EXPECT_EQ(status, 0);
}

}  // namespace
