// status.conf in memory, and beside others.
#include "fixture.h"

#include <cstdlib>
#include <new>
#include <string>
#include <utility>

namespace {
bool nextAllocationFails = false;
}

void *operator new(size_t size) {
    void *const memory = std::exchange(nextAllocationFails, false) ? nullptr : malloc(size);
    return memory != nullptr ? memory : throw std::bad_alloc();
}

void operator delete(void *memory) noexcept {
    free(memory);
}

void operator delete(void *memory, size_t /*unused*/) noexcept {
    free(memory);
}

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
    GivenStatusConf(R"({"resume_time":3,"no_space":{"a":true},"need_reindex":{"a":true},"a":true})");
    const LockAgent writer(kStatusLock);
    EXPECT_EQ("3", Ask("GetPauseInfo"));
    EXPECT_EQ("no space yes, reindex yes, updated yes", Ask("FlagsOfA"));
    EXPECT_FALSE(StatusMgr::Resume());
    EXPECT_EQ(kBusy, Left());
}

TEST_F(StatusStore, OfAManagerThatIsOutOfMemoryStaysAsItIs) {
    for (bool (*change)() : {+[] { return StatusMgr::Pause(2); }, +[] { return StatusMgr::Resume(); },
                             +[] { return StatusMgr::ShareRevive("a"); }}) {
        nextAllocationFails = true;
        EXPECT_FALSE(change());
        EXPECT_FALSE(nextAllocationFails);
    }
    EXPECT_EQ("(missing)", ReadFile(kStatusConf));
}

}  // namespace
}  // namespace fileindex_test
