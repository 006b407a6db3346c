// status.conf in memory, and the manager that changes it and tells the daemon.
#include "fixture.h"

#include <cerrno>
#include <string>
#include <vector>

namespace fileindex_test {
namespace {

class StatusStore : public FileIndexTest {};
class StatusManager : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        Script::Current().now = 1700000000;
    }
};

TEST_F(StatusStore, WithoutAFileHasNothingSet) {
    Status status;
    ASSERT_TRUE(status.Load());
    long long resumeTime = 5;
    EXPECT_TRUE(status.GetPauseInfo(resumeTime));
    EXPECT_EQ(-1, resumeTime);
    EXPECT_FALSE(status.ShareIsNoSpace("a") || status.ShareIsNeedReindex("a") || status.IsUpdated("a"));
}

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

TEST_F(StatusStore, APauseThatIsNoNumberIsReported) {
    for (const char *text :
         {R"({"resume_time":"soon"})", R"({"resume_time":[]})", R"({"resume_time":1e30})", "[]"}) {
        GivenStatusConf(text);
        long long resumeTime = 5;
        EXPECT_FALSE(StatusMgr::GetPauseInfo(resumeTime));
        EXPECT_EQ(5, resumeTime);
        EXPECT_EQ("0 status.cpp:66 json exception", Left()) << text;
    }
}

TEST_F(StatusStore, QuestionsNeverThrowAndCountOnlyMembership) {
    const struct {
        const char *text;
        bool noSpace, needReindex, updated;
    } rows[] = {
        {R"({"no_space":{"a":true},"need_reindex":{"a":true},"a":true})", true, true, true},
        {R"({"no_space":{"a":false},"need_reindex":{"a":null},"a":false})", true, true, false},
        {R"({"no_space":{"b":true},"need_reindex":{"A":true},"a":1})", false, false, true},
        {R"({"no_space":"a","need_reindex":["a"],"a":"text"})", false, false, false},
        {R"({"no_space":null,"need_reindex":5,"a":[1]})", false, false, false},
        {"[]", false, false, false},
        {R"("a")", false, false, false},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.text);
        GivenStatusConf(row.text);
        Status status;
        EXPECT_TRUE(status.Load());
        EXPECT_NO_THROW(status.ShareIsNoSpace("a") || status.ShareIsNeedReindex("a") || status.IsUpdated("a"));
        EXPECT_EQ(row.noSpace, StatusMgr::ShareIsNoSpace("a"));
        EXPECT_EQ(row.needReindex, StatusMgr::ShareIsNeedReindex("a"));
        EXPECT_EQ(row.updated, StatusMgr::IsUpdated("a"));
    }
}

TEST_F(StatusStore, NotifiesOnceForEachTimeAShareRunsOutOfSpace) {
    const struct {
        bool noSpace;
        int notifications;
        const char *conf;
    } steps[] = {
        {false, 0, R"({"no_space":null})"},      {true, 1, R"({"no_space":{"a":true}})"},
        {true, 1, R"({"no_space":{"a":true}})"}, {false, 1, R"({"no_space":{}})"},
        {true, 2, R"({"no_space":{"a":true}})"},
    };
    Status status;
    for (const auto &step : steps) {
        EXPECT_TRUE(status.ShareSetNoSpace("a", step.noSpace) && status.Save());
        EXPECT_EQ(step.notifications, Script::Current().Calls("VLIBCExecv"));
        EXPECT_EQ(step.conf, StatusConf());
    }
    EXPECT_TRUE(status.ShareSetNeedReindex("a", false) && status.ShareSetNeedReindex("b", true) &&
                status.SetUpdated("x") && status.Save());
    EXPECT_EQ(R"({"need_reindex":{"b":true},"no_space":{"a":true},"x":true})", StatusConf());
    EXPECT_EQ(2, Script::Current().Calls("VLIBCExecv"));

    Fail({.call = "VLIBCExecv"});
    EXPECT_TRUE(status.ShareSetNoSpace("b", true));
    EXPECT_TRUE(status.ShareIsNoSpace("b"));
    EXPECT_EQ("0 status.cpp:88 NotifyNoSpace failed", Left());
}

TEST_F(StatusStore, ChangesOfAMemberOfAnotherTypePassTheExceptionAndTheManagerStopsIt) {
    const std::string conf = R"({"no_space":"text","need_reindex":"text"} )";
    GivenStatusConf(conf);
    for (const bool set : {false, true}) {
        Status status;
        ASSERT_TRUE(status.Load());
        EXPECT_ANY_THROW(status.ShareSetNoSpace("a", set));
        EXPECT_EQ(set ? 1 : 0, Script::Current().Calls("VLIBCExecv"));
        EXPECT_ANY_THROW(status.ShareSetNeedReindex("a", set));
        EXPECT_FALSE(StatusMgr::ShareSetNoSpace("a", set));
        EXPECT_FALSE(StatusMgr::ShareSetNeedReindex("a", set));
    }
    daemon_.Start();
    EXPECT_FALSE(StatusMgr::ShareRevive("a"));
    EXPECT_THAT(daemon_.Commands(), IsEmpty());
    EXPECT_EQ(conf, ReadFile(kStatusConf));
    EXPECT_FALSE(IsLocked(kStatusLock));
}

TEST_F(StatusManager, SavesAndThenTellsTheDaemonUnderTheLock) {
    const struct {
        const char *name;
        std::function<bool()> change;
        std::string conf, command;
    } rows[] = {
        {"pause without end", [] { return StatusMgr::Pause(0); }, R"({"resume_time":0})",
         R"({"data":{"resume_time":0},"type":"pause"})"},
        {"pause for two hours", [] { return StatusMgr::Pause(2); }, R"({"resume_time":1700007200})",
         R"({"data":{"resume_time":1700007200},"type":"pause"})"},
        {"pause past 2038", [] { return StatusMgr::Pause(150000); }, R"({"resume_time":-2054967296})",
         R"({"data":{"resume_time":-2054967296},"type":"pause"})"},
        {"pause for more seconds than 32 bits hold", [] { return StatusMgr::Pause(1200000); },
         R"({"resume_time":1725032704})", R"({"data":{"resume_time":1725032704},"type":"pause"})"},
        {"resume", [] { return StatusMgr::Resume(); }, R"({"resume_time":-1})", R"({"data":{},"type":"resume"})"},
        {"revive", [] { return StatusMgr::ShareRevive("b"); }, R"({"no_space":null,"resume_time":-1})",
         R"({"data":{"share_name":"b"},"type":"revive_share_worker"})"},
    };
    daemon_.Start();
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Forget();
        EXPECT_TRUE(row.change());
        EXPECT_EQ(row.conf, StatusConf());
        EXPECT_THAT(Journal(), ElementsAre("lock status exclusive", "saved status.conf", "command " + row.command,
                                           "unlock status"));
        EXPECT_EQ("", Left());
    }
}

TEST_F(StatusManager, ChangesFlagsUnderTheLockWithoutTellingTheDaemon) {
    daemon_.Start();
    EXPECT_TRUE(StatusMgr::ShareSetNeedReindex("a", true));
    EXPECT_TRUE(StatusMgr::SetUpdated("x"));
    EXPECT_THAT(Journal(), ElementsAre("lock status exclusive", "saved status.conf", "unlock status",
                                       "lock status exclusive", "saved status.conf", "unlock status"));
    EXPECT_TRUE(StatusMgr::ShareSetNoSpace("a", true));
    EXPECT_EQ(R"({"need_reindex":{"a":true},"no_space":{"a":true},"x":true})", StatusConf());
    EXPECT_TRUE(StatusMgr::ShareIsNoSpace("a") && StatusMgr::ShareIsNeedReindex("a") && StatusMgr::IsUpdated("x"));
    EXPECT_TRUE(StatusMgr::ShareSetNeedReindex("a", false) && StatusMgr::ShareSetNoSpace("a", false));
    EXPECT_EQ(R"({"need_reindex":{},"no_space":{},"x":true})", StatusConf());
    EXPECT_THAT(daemon_.Commands(), IsEmpty());
}

TEST_F(StatusManager, RefusesANegativePauseBeforeAnything) {
    daemon_.Start();
    EXPECT_FALSE(StatusMgr::Pause(-1));
    EXPECT_EQ("1", Left());
    EXPECT_EQ("(missing)", StatusConf());
    EXPECT_THAT(Journal(), IsEmpty());
}

TEST_F(StatusManager, ReadsWhileAnotherHoldsTheLockAndFailsOnAnUnreadableFile) {
    GivenStatusConf(R"({"resume_time":3,"no_space":{"a":true},"need_reindex":{"a":true},"x":true})");
    const LockAgent writer(kStatusLock);
    long long resumeTime = 0;
    EXPECT_TRUE(StatusMgr::GetPauseInfo(resumeTime));
    EXPECT_EQ(3, resumeTime);
    EXPECT_TRUE(StatusMgr::ShareIsNoSpace("a") && StatusMgr::ShareIsNeedReindex("a") && StatusMgr::IsUpdated("x"));
    EXPECT_FALSE(StatusMgr::Resume());
    EXPECT_EQ(kBusy, Left());

    GivenStatusConf("{");
    EXPECT_FALSE(StatusMgr::GetPauseInfo(resumeTime));
    EXPECT_EQ(kStatusConfUnreadable, Left());
    EXPECT_FALSE(StatusMgr::ShareIsNoSpace("a") || StatusMgr::ShareIsNeedReindex("a") ||
                 StatusMgr::IsUpdated("x"));
}

}  // namespace
}  // namespace fileindex_test
