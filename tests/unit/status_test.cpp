// status.conf in memory, and beside others.
#include "fixture.h"

#include <string>

namespace fileindex_test {
namespace {

class StatusStore : public FileIndexTest {};

TEST_F(StatusStore, KeepsAPauseBeyond32BitsThroughTheFile) {
    for (const long long end : {0LL, 1700003600LL, 5000000000000LL, -5LL}) {
        Status status;
        EXPECT_TRUE(status.Pause(end) && status.Save());
        Status again;
        long long resumeTime = 7;
        EXPECT_TRUE(again.Load() && again.GetPauseInfo(resumeTime));
        EXPECT_EQ(end, resumeTime);
        EXPECT_TRUE(again.Resume() && again.GetPauseInfo(resumeTime));
        EXPECT_EQ(-1, resumeTime);
    }
}

TEST_F(StatusStore, ChangesOfAMemberOfAnotherTypePassTheException) {
    const std::string conf = R"({"no_space":"text","need_reindex":"text"} )";
    GivenStatusConf(conf);
    for (const bool set : {false, true}) {
        Status status;
        ASSERT_TRUE(status.Load());
        EXPECT_ANY_THROW(status.ShareSetNoSpace("a", set));
        EXPECT_EQ(set ? 1 : 0, Script::Current().Calls("VLIBCExecv"));
        EXPECT_ANY_THROW(status.ShareSetNeedReindex("a", set));
    }
    EXPECT_EQ(conf, ReadFile(kStatusConf));
}

TEST_F(StatusStore, ReadsWhileAnotherHoldsTheLock) {
    GivenStatusConf(R"({"resume_time":3,"no_space":{"a":true},"need_reindex":{"a":true},"x":true})");
    const LockAgent writer(kStatusLock);
    long long resumeTime = 0;
    EXPECT_TRUE(StatusMgr::GetPauseInfo(resumeTime));
    EXPECT_EQ(3, resumeTime);
    EXPECT_TRUE(StatusMgr::ShareIsNoSpace("a") && StatusMgr::ShareIsNeedReindex("a") && StatusMgr::IsUpdated("x"));
    EXPECT_FALSE(StatusMgr::Resume());
    EXPECT_EQ(kBusy, Left());
}

}  // namespace
}  // namespace fileindex_test
