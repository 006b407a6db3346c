// The index when shares are renamed, removed, paused and resumed, and after an upgrade.
#include "fixture.h"

#include <cerrno>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr char kPhotoQueue[] = "/vol1/photo/@eaDir/VORK@file_index_queue";
const std::string kUnregistered = std::string("unmonitor fileindex 1 ") + kPhotoQueue;
const std::string kRegistered = R"(monitor fileindex 1 {"config":[{"ignore":["@eaDir"],"mask":65486,)"
                                R"("path":"/vol1/photo/a"}],"queue":"/vol1/photo/@eaDir/VORK@file_index_queue"})";

std::string WorkerCommand(const std::string &type) {
    return R"(command {"data":{"share_name":"photo"},"type":")" + type + "\"}";
}

class ShareLifecycle : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        GivenShare("new", "/vol2/new");
        GivenFolders({FolderRecord("/music", "M", "a"), FolderRecord("/photo/a", "A", "p")});
        Platform::Current().searchOn = true;
    }
};
class Upgrade : public ShareLifecycle {};

TEST_F(ShareLifecycle, RenameMovesTheFoldersOfTheShareAndTellsNobody) {
    GivenFolders({FolderRecord("/photo", "All", "d"), FolderRecord("/photo/a/b", "B", "p"),
                  FolderRecord("/photos/a", "", "v"), FolderRecord("/music", "M", "a")});
    EXPECT_TRUE(IndexMgr::ShareRename("photo", "new"));
    EXPECT_EQ(Canonical("{" + FolderRecord("/music", "M", "a") + "," + FolderRecord("/new", "All", "d") + "," +
                        FolderRecord("/new/a/b", "B", "p") + "," + FolderRecord("/photos/a", "", "v") + "}"),
              FolderConf());
    const std::string renamed = FolderConf();
    EXPECT_TRUE(IndexMgr::ShareRename("nobody", "new"));
    EXPECT_EQ(renamed, FolderConf());
    EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "saved folder.conf", "unlock folder",
                                       "lock folder exclusive", "saved folder.conf", "unlock folder"));
    EXPECT_FALSE(fs::exists(kStatusConf));
}

TEST_F(ShareLifecycle, RenameWorksWhenTheOldShareIsGoneAndFailsWhenTheNewOneIsNotThere) {
    Platform::Current().shares.erase("photo");
    const std::string conf = ReadFile(kFolderConf);
    EXPECT_FALSE(IndexMgr::ShareRename("photo", "unborn"));
    EXPECT_EQ(FILEINDEX_ERR_BAD_PARAM, LeftCode());
    EXPECT_EQ(conf, ReadFile(kFolderConf));
    EXPECT_TRUE(IndexMgr::ShareRename("photo", "new"));
    EXPECT_EQ("{" + FolderRecord("/music", "M", "a") + "," + FolderRecord("/new/a", "A", "p") + "}", FolderConf());
}

TEST_F(ShareLifecycle, RemoveDropsTheFoldersAndStopsIndexingOnlyAfterTheLast) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb");
    EXPECT_TRUE(IndexMgr::ShareRemove("photo"));
    EXPECT_EQ("{" + FolderRecord("/music", "M", "a") + "}", FolderConf());
    EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "saved folder.conf", "unlock folder"));
    EXPECT_TRUE(fs::exists("/vol1/photo/@eaDir/VORK@.fileindexdb"));
    Forget();
    Platform::Current().shares.erase("music");  // a share that is gone already is removed like any other
    EXPECT_TRUE(IndexMgr::ShareRemove("music"));
    EXPECT_EQ("{}", FolderConf());
    EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "saved folder.conf", "stop fileindexd 1",
                                       "search 0", "restart samba", "unlock folder"));
}

TEST_F(ShareLifecycle, RemoveOfTheLastFolderIgnoresFailingServices) {
    const struct {
        const char *call;
        int line;
        bool restarted;
    } rows[] = {
        {"VLIBServiceStop", 535, true}, {"VORKSMBSetSpotlight", 540, false}, {"VLIBServiceRestart", 542, false}};
    for (const auto &row : rows) {
        Forget();
        GivenFolders({FolderRecord("/photo/a", "", "")});
        Platform::Current().searchOn = true;
        Fail({.call = row.call, .error = 0xA00});
        EXPECT_TRUE(IndexMgr::ShareRemove("photo"));
        EXPECT_EQ(
            "0 index_mgr.cpp:" + std::to_string(row.line) + " " + row.call + " failed: err=[0x0A00 platform.c:77]",
            Left());
        EXPECT_EQ(row.restarted, testing::Value(Journal(), testing::Contains("restart samba")));
    }
}

TEST_F(ShareLifecycle, AnEmptyNameNeverMeansAll) {
    GivenShare("", "/vol2/unnamed");
    GivenFolders({FolderRecord("//x", "", ""), FolderRecord("/photo/a", "", "")});
    EXPECT_TRUE(IndexMgr::ShareRename("", "new"));
    EXPECT_EQ("{" + FolderRecord("/new/x", "", "") + "," + FolderRecord("/photo/a", "", "") + "}", FolderConf());
    EXPECT_TRUE(IndexMgr::ShareRemove(""));
    EXPECT_EQ(2U, Parse(FolderConf()).size());
}

TEST_F(ShareLifecycle, RenameAndRemoveThatFailLeaveTheListAndLetGoOfTheLock) {
    const std::pair<Fault, std::string> rows[] = {
        {{.call = "flock", .about = kFolderLock, .times = 3, .error = EAGAIN}, kBusy},
        {{.call = "open", .about = kFolderConf}, kFolderConfUnreadable},
        {{.call = "write", .about = kFolderConf, .error = ENOSPC}, kFolderConfUnwritable}};
    const std::string conf = ReadFile(kFolderConf);
    for (const auto &[fault, left] : rows) {
        for (const bool rename : {false, true}) {
            Fail(fault);
            EXPECT_FALSE(rename ? IndexMgr::ShareRename("photo", "new") : IndexMgr::ShareRemove("photo"));
            EXPECT_EQ(left, Left());
            EXPECT_EQ(conf, ReadFile(kFolderConf));
            EXPECT_FALSE(IsLocked(kFolderLock));
            Script::Current().Finish();
        }
    }
}

TEST_F(ShareLifecycle, PauseAndResumeGoInOppositeOrders) {
    daemon_.Start();
    EXPECT_TRUE(IndexMgr::SharePause("photo"));
    EXPECT_TRUE(IndexMgr::ShareResume("photo"));
    EXPECT_THAT(Journal(), ElementsAre(WorkerCommand("delete_share_worker"), kUnregistered, kRegistered,
                                       WorkerCommand("revive_share_worker")));
    EXPECT_EQ(0, Script::Current().Calls("flock", kFolderLock));
    Forget();
    daemon_.Stop();
    EXPECT_FALSE(IndexMgr::SharePause("photo"));
    EXPECT_THAT(Journal(), IsEmpty()) << "the monitor stays";
    EXPECT_FALSE(IndexMgr::ShareResume("photo"));
    EXPECT_THAT(Journal(), ElementsAre(kRegistered));
    EXPECT_EQ("", Left());
}

TEST_F(ShareLifecycle, PauseAndResumeReportAFailingMonitor) {
    daemon_.Start();
    Fail({.call = "MonitorQueue::Delete"});
    Fail({.call = "MonitorQueue::Upsert"});
    EXPECT_FALSE(IndexMgr::SharePause("photo"));
    EXPECT_FALSE(IndexMgr::ShareResume("photo"));
    EXPECT_THAT(Journal(), ElementsAre(WorkerCommand("delete_share_worker")));
    EXPECT_EQ(
        "0 index_mgr.cpp:350 MonitorQueue::Delete failed | "
        "index_mgr.cpp:484 DeleteVorkNotifydCfg failed, share=photo | "
        "index_mgr.cpp:324 MonitorQueue::Add failed | "
        "index_mgr.cpp:501 UpsertVorkNotifydCfg failed, share=photo",
        Left());
}

TEST_F(ShareLifecycle, CleaningRemovesTheIndexDataAndNothingElse) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb/deep/er");
    WriteFile("/vol1/photo/@eaDir/other", "kept");
    GivenQueue("photo", "x", ".tmp");
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo"));
    EXPECT_THAT(Journal(), ElementsAre(std::string("exec /bin/rm -rf ") + kPhotoQueue,
                                       std::string("exec /bin/rm -rf ") + kPhotoQueue + ".tmp",
                                       "exec /bin/rm -rf /vol1/photo/@eaDir/VORK@.fileindexdb"));
    EXPECT_EQ("kept", ReadFile("/vol1/photo/@eaDir/other"));
    Fail({.call = "VLIBCExec", .times = 3, .result = 1});
    EXPECT_TRUE(IndexMgr::CleanShareIndexData("photo")) << "what rm says does not count";
}

TEST_F(ShareLifecycle, CleaningStopsWhereThePathIsUnknownOrCut) {
    EXPECT_FALSE(IndexMgr::CleanShareIndexData("none"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:653 FILEIDXQueuePathGet failed, share=none"));
    Fail({.call = "VORKShareGet", .nth = 2});
    EXPECT_FALSE(IndexMgr::CleanShareIndexData("photo"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:661 FILEIDXDBPathGet failed, share=photo"));
    EXPECT_EQ(2U, Journal().size()) << "the queue files are gone already";
    Forget();
    for (size_t length = 4050; length < 4096; ++length) {
        Platform::Current().shares["long"].path = "/" + std::string(length, 'x');
        IndexMgr::CleanShareIndexData("long");
    }
    EXPECT_FALSE(IndexMgr::CleanShareIndexData("long"));
    for (const std::string &line : Journal()) {
        EXPECT_TRUE(line.ends_with("_queue") || line.ends_with("_queue.tmp") || line.ends_with("db")) << line;
    }
}

TEST_F(Upgrade, WithoutFoldersStopsTheDaemon) {
    fs::remove(kFolderConf);
    EXPECT_TRUE(Updater_zol60_beta2());
    EXPECT_THAT(Journal(), ElementsAre("stop fileindexd 1"));
    Fail({.call = "VLIBServiceStop", .error = 0x1500});
    EXPECT_FALSE(Updater_zol60_beta2());
    EXPECT_EQ("0 utils.cpp:641 VLIBServiceStart failed: err=[0x1500 platform.c:77]", Left());
}

TEST_F(Upgrade, WithFoldersStartsRegistersAndReindexesAll) {
    GivenFolders(
        {FolderRecord("/photo/a", "", "p"), FolderRecord("/music", "", "a"), FolderRecord("/music/x", "", "")});
    const LockAgent writer(kFolderLock);  // no lock is taken
    EXPECT_TRUE(Updater_zol60_beta2());
    EXPECT_THAT(Journal(),
                ElementsAre("start fileindexd 1", "search 1",
                            testing::AllOf(testing::StartsWith("monitor"), testing::HasSubstr("/vol2/music/x")),
                            kRegistered, R"(event {"data":null,"event":65536,"path":"/vol2/music"})",
                            R"(event {"data":null,"event":65536,"path":"/vol2/music/x"})",
                            R"(event {"data":null,"event":65536,"path":"/vol1/photo/a"})"));
    EXPECT_EQ("", Left());
}

TEST_F(Upgrade, StopsAtTheFirstFailure) {
    const FailingStep steps[] = {
        {"list", WillFail({.call = "open", .about = kFolderConf}), 0, kFolderConfUnreadable.substr(2)},
        {"start", WillFail({.call = "VLIBServiceStart", .error = 0x1500}), 0,
         "utils.cpp:650 VLIBServiceStart failed: err=[0x1500 platform.c:77]"},
        {"search", WillFail({.call = "VORKSMBSetSpotlight", .error = 0x1500}), 1,
         "utils.cpp:654 VORKSMBSetSpotlight failed: err=[0x1500 platform.c:77]"},
        {"second monitor", WillFail({.call = "MonitorQueue::Upsert", .nth = 2}), 3,
         "utils.cpp:671 UpsertVorkNotifydCfg failed, share=photo"},
        {"second event", WillFail({.call = "open", .about = kPhotoQueue}), 5, "utils.cpp:678 Reindex failed"},
        {"share name", [] { GivenFolders({FolderRecord("", "", "")}); }, 2,
         "utils.cpp:661 GetShareNameByPath failed, path="},
    };
    for (const FailingStep &step : steps) {
        SCOPED_TRACE(step.name);
        Forget();
        step.arrange();
        EXPECT_FALSE(Updater_zol60_beta2());
        EXPECT_THAT(Left(), testing::EndsWith(step.left));
        EXPECT_EQ(step.done, Doings().size());
        EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    }
}

}  // namespace
}  // namespace fileindex_test
