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
        EXPECT_EQ("", Left());
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
        EXPECT_EQ(std::string("1 index_mgr.cpp:569 Bad param: ") + request, Left());
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
        const std::string left = Left();
        EXPECT_TRUE(left.starts_with("1 ")) << left;
        EXPECT_TRUE(left.ends_with(std::string(" | index_mgr.cpp:582 Upsert failed, folder=") + element)) << left;
        EXPECT_THAT(Journal(), ElementsAre("lock folder exclusive", "unlock folder"));
        EXPECT_EQ(conf, ReadFile(kFolderConf));
    }
}

TEST_F(IndexUpsert, IgnoresAFailingSearchSetting) {
    const struct {
        Fault fault;
        bool set;
        std::string left;
    } rows[] = {
        {{.call = "VORKSMBSetSpotlight", .error = 0x1501},
         false,
         "0 index_mgr.cpp:611 VORKSMBSetSpotlight failed: err=[0x1501 platform.c:77]"},
        {{.call = "VLIBServiceRestart", .about = "samba", .error = 0x0A},
         true,
         "0 index_mgr.cpp:613 VLIBServiceRestart failed: err=[0x000A platform.c:77]"},
    };
    for (const auto &row : rows) {
        Forget();
        Platform::Current().searchOn = false;
        Fail(row.fault);
        EXPECT_TRUE(Upsert(R"([{"path":"/photo/a"}])"));
        EXPECT_EQ(row.left, Left());
        EXPECT_EQ(row.set, testing::Value(Journal(), testing::Contains("search 1")));
        EXPECT_THAT(Journal(), testing::Not(testing::Contains("restart samba")));
    }
}

/// The share goes away when the search setting is asked for, which is after the monitors and before the commands.
void LoseMusicInBetween() {
    Script::Current().Fail(
        {.call = "VORKSMBIsEnableSpotlight", .action = [] { Platform::Current().shares.erase("music"); }});
}

const std::string kNoMonitor = "0 index_mgr.cpp:324 MonitorQueue::Add failed | ";

const FailingStep kFailingSteps[] = {
    {"LockBusy", WillFail({.call = "flock", .about = kFolderLock, .times = 3, .error = EAGAIN}), 0, kBusy},
    {"LockFileNotToBeOpened", WillFail({.call = "open", .about = kFolderLock, .error = EACCES}), 0, kBusy},
    {"ListNotToBeRead", WillFail({.call = "open", .about = kFolderConf}), 0, kFolderConfUnreadable},
    {"ListMalformed", [] { WriteFile(kFolderConf, "[]"); }, 0, "8 folders.cpp Malformed folders: []"},
    {"ListNotToBeSaved", WillFail({.call = "write", .about = kFolderConf}), 0, kFolderConfUnwritable},
    {"FirstMonitor", WillFail({.call = "MonitorQueue::Upsert"}), 1,
     kNoMonitor + "index_mgr.cpp:598 UpsertVorkNtifydCfg failed, share=music"},
    {"SecondMonitor", WillFail({.call = "MonitorQueue::Upsert", .nth = 2}), 2,
     kNoMonitor + "index_mgr.cpp:598 UpsertVorkNtifydCfg failed, share=photo"},
    {"MonitorThrows", WillFail({.call = "MonitorQueue::Upsert", .result = -2}), 1,
     "0 index_mgr.cpp:598 UpsertVorkNtifydCfg failed, share=music"},
    {"DaemonStart", WillFail({.call = "VLIBServiceStart", .error = 0x1500}), 3,
     "0 index_mgr.cpp:605 VLIBServiceStart failed: err=[0x1500 platform.c:77]"},
    {"FirstCommand", WillFail({.call = "connect"}), 6, "0 index_mgr.cpp:621 SendCammandToDaemon failed"},
    {"ThirdCommand", WillFail({.call = "connect", .nth = 3}), 8, "0 index_mgr.cpp:621 SendCammandToDaemon failed"},
    {"ShareGoneBeforeTheEvents", LoseMusicInBetween, 9, "2 index_mgr.cpp:629 GetFullPath failed, path=/music/a"},
    {"FirstEvent", WillFail({.call = "open", .about = "/vol2/music/@eaDir"}), 9,
     "0 index_mgr.cpp:634 AddCustomEvent failed"},
    {"SecondEvent", WillFail({.call = "flock", .about = "/vol1/photo/@eaDir", .error = ENOLCK}), 10,
     "0 index_mgr.cpp:634 AddCustomEvent failed"},
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
    EXPECT_EQ(step.left, Left());
    ExpectOnlyTheFirst(step.done, Steps());
    EXPECT_EQ(step.done == 0 ? Canonical(before) : ConfOfRequest(), FolderConf());
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
    EXPECT_EQ("", Left());
}

INSTANTIATE_TEST_SUITE_P(Of, IndexUpsertStep, testing::ValuesIn(kFailingSteps),
                         [](const auto &info) { return info.param.name; });

TEST_F(IndexUpsert, OfAFolderTooManyChangesNothing) {
    std::vector<std::string> records;
    records.reserve(999);
    for (int number = 0; number < 999; ++number) {
        records.push_back(FolderRecord("/photo/" + std::to_string(number), "", "d"));
    }
    GivenFolders(records);
    const std::string conf = ReadFile(kFolderConf);
    EXPECT_FALSE(Upsert(R"([{"path":"/music/a"},{"path":"/music/b"}])"));
    EXPECT_EQ(
        "5 folders.cpp Exceed max folder size | "
        R"(index_mgr.cpp:582 Upsert failed, folder={"path":"/music/b"})",
        Left());
    EXPECT_EQ(conf, ReadFile(kFolderConf));
    EXPECT_TRUE(Upsert(R"([{"path":"/music/a"}])"));
}

TEST_F(IndexUpsert, IsRefusedWhileAnotherHoldsTheLockAndLeavesItToHim) {
    LockAgent other(kFolderLock);
    EXPECT_FALSE(Upsert(kRequest));
    EXPECT_EQ(kBusy, Left());
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
    EXPECT_FALSE(IndexMgr::Update("/none/a", Json::Value()));
    EXPECT_EQ("2 index_mgr.cpp:430 GetFullPath failed, path=/none/a", Left());
    Fail({.call = "open", .about = "VORK@file_index_queue", .nth = 2, .error = EROFS});
    EXPECT_FALSE(IndexMgr::Update("/photo/a", Json::Value()));
    EXPECT_EQ("0 index_mgr.cpp:436 AddCustomEvent failed", Left());
    EXPECT_EQ(1U, Queue("photo").size());
}

}  // namespace
}  // namespace fileindex_test
