// Adding and changing indexed folders: who is told what, in which order, and what a failing step leaves behind.
#include "fixture.h"

#include <algorithm>
#include <cerrno>
#include <functional>
#include <string>
#include <vector>

namespace fileindex_test {
namespace {

const std::string kRequest = R"([{"path":"/photo/b","name":"B","photo":true},
                                 {"path":"/music/a","audio":true},
                                 {"path":"/photo/a","document":true}])";

std::string Command(const std::string &path) {
    return R"(command {"data":{"folder_path":")" + path + R"("},"type":"upsert_folder_setting"})";
}

std::string Event(const std::string &fullPath) {
    return R"(event {"data":{"audio":true,"document":true,"photo":true,"video":true},"event":131072,"path":")" +
           fullPath + "\"}";
}

std::string MonitorEntry(const std::string &fullPath) {
    return R"({"ignore":["@eaDir"],"mask":65486,"path":")" + fullPath + "\"}";
}

std::string MonitorOf(const std::string &share, const std::string &entries) {
    return R"(monitor fileindex 1 {"config":[)" + entries + R"(],"queue":")" + share +
           R"(/@eaDir/VORK@file_index_queue"})";
}

/// What a successful request does, between taking the lock and giving it back.
std::vector<std::string> Steps() {
    return {"saved folder.conf",
            MonitorOf("/vol2/music", MonitorEntry("/vol2/music/a")),
            MonitorOf("/vol1/photo", MonitorEntry("/vol1/photo/a") + "," + MonitorEntry("/vol1/photo/b")),
            "start fileindexd 1",
            "search 1",
            "restart samba",
            Command("/photo/b"),
            Command("/music/a"),
            Command("/photo/a"),
            Event("/vol2/music/a"),
            Event("/vol1/photo/a"),
            Event("/vol1/photo/b")};
}

std::string ConfOfRequest() {
    return Canonical("{" + FolderRecord("/music/a", "", "a") + "," + FolderRecord("/photo/a", "", "d") + "," +
                     FolderRecord("/photo/b", "B", "p") + "}");
}

class IndexUpsert : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        daemon_.Start();
    }
    static bool Upsert(const std::string &request) { return IndexMgr::Upsert(Parse(request)); }
};

TEST_F(IndexUpsert, SavesAndThenTellsEveryPartyUnderTheLock) {
    bool (*const kOperations[])(const Json::Value &) = {IndexMgr::Upsert, IndexMgr::Set, IndexMgr::Add};
    for (const auto operation : kOperations) {
        std::vector<std::string> journal = Steps();
        journal.insert(journal.begin(), "lock folder exclusive");
        journal.emplace_back("unlock folder");
        EXPECT_TRUE(operation(Parse(kRequest)));
        EXPECT_EQ(journal, Journal());
        EXPECT_EQ(ConfOfRequest(), FolderConf());
        EXPECT_THAT(Records(), IsEmpty());
        EXPECT_EQ(FILEINDEX_ERR_NONE, TakeError());
        Forget();
        Platform::Current().searchOn = false;
        GivenFolderConf("{}");
    }
}

TEST_F(IndexUpsert, OfNothingStillSavesAndStartsTheDaemon) {
    Platform::Current().searchOn = true;
    GivenFolders({FolderRecord("/photo/a", "A", "d")});
    EXPECT_TRUE(Upsert("[]"));
    EXPECT_THAT(Journal(),
                ElementsAre("lock folder exclusive", "saved folder.conf", "start fileindexd 1", "unlock folder"));
    EXPECT_EQ(1, Script::Current().Calls("VORKSMBIsEnableSpotlight"));
    EXPECT_EQ("{" + FolderRecord("/photo/a", "A", "d") + "}", FolderConf());
}

TEST_F(IndexUpsert, OfOnePathTwiceSendsTwoCommandsAndTheLaterReport) {
    Platform::Current().searchOn = true;
    EXPECT_TRUE(Upsert(R"([{"path":"/photo/a","audio":true},{"path":"/photo/a","video":true}])"));
    EXPECT_EQ(2U, SentCommands().size());
    EXPECT_THAT(Queue("photo"),
                ElementsAre(R"({"data":{"audio":false,"document":false,"photo":false,"video":true},)"
                            R"("event":131072,"path":"/vol1/photo/a"})"));
    EXPECT_EQ("{" + FolderRecord("/photo/a", "", "av") + "}", FolderConf());
}

TEST_F(IndexUpsert, OfWhatIsNoArrayDoesNothing) {
    for (const char *request : {R"({"path":"/photo/a"})", "null", "7", R"("/photo/a")"}) {
        Forget();
        EXPECT_FALSE(Upsert(request));
        EXPECT_EQ(FILEINDEX_ERR_BAD_PARAM, TakeError());
        EXPECT_THAT(Records(), ElementsAre(std::string("index_mgr.cpp:569 Bad param: ") + request));
        EXPECT_THAT(Journal(), IsEmpty());
        EXPECT_EQ(0, Script::Current().Calls("open"));
    }
}

TEST_F(IndexUpsert, WithOneBadElementSavesAndTellsNothing) {
    GivenFolders({FolderRecord("/photo/a", "A", "d")});
    const std::string conf = ReadFile(kFolderConf);
    for (const char *element : {R"({"path":"/none/x"})", R"({"name":"x"})", "{}", "5", R"("/photo/c")", "null",
                                R"(["/photo/c"])", R"({"path":["/photo/c"]})", R"({"path":""})"}) {
        SCOPED_TRACE(element);
        Forget();
        EXPECT_FALSE(
            Upsert(std::string(R"([{"path":"/photo/b"},{"path":"/photo/a","audio":true},)") + element + "]"));
        EXPECT_EQ(FILEINDEX_ERR_BAD_PARAM, TakeError());
        EXPECT_EQ(std::string("index_mgr.cpp:582 Upsert failed, folder=") + element, Records().back());
        EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "unlock folder"));
        EXPECT_EQ(conf, ReadFile(kFolderConf));
    }
}

TEST_F(IndexUpsert, IgnoresAFailingSearchSetting) {
    const struct {
        Fault fault;
        std::string missing, record;
    } rows[] = {
        {{.call = "VORKSMBSetSpotlight", .error = 0x1501},
         "search 1",
         "index_mgr.cpp:611 VORKSMBSetSpotlight failed: err=[0x1501 platform.c:77]"},
        {{.call = "VLIBServiceRestart", .about = "samba", .error = 0x0A},
         "",
         "index_mgr.cpp:613 VLIBServiceRestart failed: err=[0x000A platform.c:77]"},
    };
    for (const auto &row : rows) {
        Forget();
        Platform::Current().searchOn = false;
        Fail(row.fault);
        EXPECT_TRUE(Upsert(R"([{"path":"/photo/a"}])"));
        EXPECT_THAT(Records(), ElementsAre(row.record));
        EXPECT_EQ(row.missing.empty(), testing::Value(Journal(), testing::Contains("search 1")));
        EXPECT_THAT(Journal(), testing::Not(testing::Contains("restart samba")));
        EXPECT_EQ(FILEINDEX_ERR_NONE, TakeError());
    }
}

/// One step that fails, the number of Steps() that were done before it, and what it leaves.
struct FailingStep {
    const char *name;
    std::function<void()> arrange;
    size_t done;
    std::vector<std::string> records;
    _tag_fileindex_err_ code;
};

std::function<void()> WillFail(const Fault &fault) {
    return [fault] { Script::Current().Fail(fault); };
}

/// The share goes away when the search setting is asked for, which is after the monitors and before the commands.
void LoseMusicInBetween() {
    Script::Current().Fail(
        {.call = "VORKSMBIsEnableSpotlight", .action = [] { Platform::Current().shares.erase("music"); }});
}

const FailingStep kFailingSteps[] = {
    {"LockBusy",
     WillFail({.call = "flock", .about = kFolderLock, .times = 3, .error = EAGAIN}),
     0,
     {"config.cpp Failed to lock folder"},
     FILEINDEX_ERR_LOCK},
    {"LockFileNotToBeOpened",
     WillFail({.call = "open", .about = kFolderLock, .error = EACCES}),
     0,
     {"config.cpp Failed to lock folder"},
     FILEINDEX_ERR_LOCK},
    {"ListNotToBeRead",
     WillFail({.call = "open", .about = kFolderConf, .error = EACCES}),
     0,
     {"config.cpp Failed to load json from /usr/vork/etc/fileindex/folder.conf"},
     FILEINDEX_ERR_LOAD_JSON},
    {"ListMalformed",
     [] { WriteFile(kFolderConf, "[]"); },
     0,
     {"folders.cpp Malformed folders: []"},
     FILEINDEX_ERR_MALFORMED_CONFIG},
    {"ListNotToBeSaved",
     WillFail({.call = "write", .about = kFolderConf, .error = ENOSPC}),
     0,
     {"config.cpp Failed to save json to /usr/vork/etc/fileindex/folder.conf"},
     FILEINDEX_ERR_SAVE_JSON},
    {"FirstMonitor",
     WillFail({.call = "MonitorQueue::Upsert"}),
     1,
     {"index_mgr.cpp:324 MonitorQueue::Add failed", "index_mgr.cpp:598 UpsertVorkNtifydCfg failed, share=music"},
     FILEINDEX_ERR_NONE},
    {"SecondMonitor",
     WillFail({.call = "MonitorQueue::Upsert", .nth = 2}),
     2,
     {"index_mgr.cpp:324 MonitorQueue::Add failed", "index_mgr.cpp:598 UpsertVorkNtifydCfg failed, share=photo"},
     FILEINDEX_ERR_NONE},
    {"MonitorThrows",
     WillFail({.call = "MonitorQueue::Upsert", .result = -2}),
     1,
     {"index_mgr.cpp:598 UpsertVorkNtifydCfg failed, share=music"},
     FILEINDEX_ERR_NONE},
    {"DaemonStart",
     WillFail({.call = "VLIBServiceStart", .error = 0x1500}),
     3,
     {"index_mgr.cpp:605 VLIBServiceStart failed: err=[0x1500 platform.c:77]"},
     FILEINDEX_ERR_NONE},
    {"FirstCommand",
     WillFail({.call = "connect", .error = ECONNREFUSED}),
     6,
     {"index_mgr.cpp:621 SendCammandToDaemon failed"},
     FILEINDEX_ERR_NONE},
    {"ThirdCommand",
     WillFail({.call = "connect", .nth = 3, .error = ECONNREFUSED}),
     8,
     {"index_mgr.cpp:621 SendCammandToDaemon failed"},
     FILEINDEX_ERR_NONE},
    {"ShareGoneBeforeTheEvents",
     LoseMusicInBetween,
     9,
     {"index_mgr.cpp:629 GetFullPath failed, path=/music/a"},
     FILEINDEX_ERR_PATH},
    {"FirstEvent",
     WillFail({.call = "open", .about = "/vol2/music/@eaDir", .error = EROFS}),
     9,
     {"index_mgr.cpp:634 AddCustomEvent failed"},
     FILEINDEX_ERR_NONE},
    {"SecondEvent",
     WillFail({.call = "flock", .about = "/vol1/photo/@eaDir", .error = ENOLCK}),
     10,
     {"index_mgr.cpp:634 AddCustomEvent failed"},
     FILEINDEX_ERR_NONE},
};

class IndexUpsertStep : public IndexUpsert, public testing::WithParamInterface<FailingStep> {};

TEST_P(IndexUpsertStep, ThatFailsStopsWhatFollowsAndTheRequestRepeatedRepairsIt) {
    const FailingStep &step = GetParam();
    const std::string conf = "{ }";
    GivenFolderConf(conf);
    const auto descriptors = OpenDescriptors();
    step.arrange();
    const std::string before = ReadFile(kFolderConf);

    EXPECT_FALSE(Upsert(kRequest));
    EXPECT_EQ(step.code, TakeError());
    EXPECT_EQ(step.records, Records());
    std::vector<std::string> journal = Journal();
    for (const char *line :
         {"lock folder exclusive", "unlock folder", "lock status exclusive", "saved status.conf",
          "unlock status"}) {  // the last three when an event could not be queued
        std::erase(journal, line);
    }
    const std::vector<std::string> all = Steps();
    EXPECT_EQ(std::vector(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(step.done)), journal);
    if (step.done == 0) {
        EXPECT_EQ(before, ReadFile(kFolderConf));
    } else {
        EXPECT_EQ(ConfOfRequest(), FolderConf());
    }
    EXPECT_EQ(descriptors, OpenDescriptors());
    EXPECT_FALSE(IsLocked(kFolderLock));
    EXPECT_FALSE(IsLocked(kStatusLock));

    EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    Forget();
    GivenShare("music", "/vol2/music");
    if (before == "[]") {
        GivenFolderConf(conf);
    }
    EXPECT_TRUE(Upsert(kRequest));
    EXPECT_EQ(ConfOfRequest(), FolderConf());
    EXPECT_THAT(Records(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(Of, IndexUpsertStep, testing::ValuesIn(kFailingSteps),
                         [](const auto &info) { return info.param.name; });

TEST_F(IndexUpsert, OfAFolderTooManyChangesNothing) {
    std::vector<std::string> records;
    for (int number = 0; number < 999; ++number) {
        records.push_back(FolderRecord("/photo/" + std::to_string(number), "", "d"));
    }
    GivenFolders(records);
    const std::string conf = ReadFile(kFolderConf);
    EXPECT_FALSE(Upsert(R"([{"path":"/music/a"},{"path":"/music/b"}])"));
    EXPECT_EQ(FILEINDEX_ERR_EXCEED_MAX_FOLDER, TakeError());
    EXPECT_THAT(Records(), ElementsAre("folders.cpp Exceed max folder size",
                                       R"(index_mgr.cpp:582 Upsert failed, folder={"path":"/music/b"})"));
    EXPECT_EQ(conf, ReadFile(kFolderConf));
    EXPECT_TRUE(Upsert(R"([{"path":"/music/a"}])"));
}

TEST_F(IndexUpsert, IsRefusedWhileAnotherHoldsTheLockAndLeavesItToHim) {
    LockAgent other(kFolderLock);
    EXPECT_FALSE(Upsert(kRequest));
    EXPECT_EQ(FILEINDEX_ERR_LOCK, TakeError());
    EXPECT_TRUE(IsLocked(kFolderLock));
    EXPECT_EQ("(missing)", ReadFile(kFolderConf));
    other.Kill();
    EXPECT_TRUE(Upsert(kRequest));
}

TEST_F(IndexUpsert, HoldsTheLockUntilTheLastEvent) {
    std::vector<bool> held;
    const auto look = [&held] { held.push_back(IsLocked(kFolderLock)); };
    Fail({.call = "MonitorQueue::Upsert", .times = 2, .action = look});
    Fail({.call = "VLIBServiceStart", .action = look});
    Fail({.call = "connect", .times = 3, .action = look});
    Fail({.call = "write", .about = "VORK@file_index_queue", .times = 3, .action = look});
    EXPECT_TRUE(Upsert(kRequest));
    EXPECT_EQ(std::vector<bool>(9, true), held);
}

TEST_F(IndexUpsert, UpdateQueuesAnEventAndNothingElse) {
    GivenFolderConf("{");  // not even read
    EXPECT_TRUE(IndexMgr::Update("/photo/a", "anything"));
    EXPECT_THAT(Journal(), ElementsAre(R"(event {"data":"anything","event":131072,"path":"/vol1/photo/a"})"));
    EXPECT_THAT(Records(), IsEmpty());

    EXPECT_FALSE(IndexMgr::Update("/none/a", Json::Value()));
    EXPECT_EQ(FILEINDEX_ERR_PATH, TakeError());
    Fail({.call = "open", .about = "VORK@file_index_queue", .nth = 2, .error = EROFS});
    EXPECT_FALSE(IndexMgr::Update("/photo/a", Json::Value()));
    EXPECT_THAT(Records(), ElementsAre("index_mgr.cpp:430 GetFullPath failed, path=/none/a",
                                       "index_mgr.cpp:436 AddCustomEvent failed"));
    EXPECT_EQ(FILEINDEX_ERR_NONE, TakeError());
    EXPECT_EQ(1U, Queue("photo").size());
}

}  // namespace
}  // namespace fileindex_test
