// Removing indexed folders, and asking for paths to be indexed again.
#include "fixture.h"

#include <cerrno>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

constexpr char kAllChange[] = R"({"audio":true,"document":true,"photo":true,"video":true})";

std::string Command(const std::string &path) {
    return R"(command {"data":{"folder_path":")" + path + R"("},"type":"delete_folder_setting"})";
}

std::string Event(const std::string &path, const std::string &fullPath) {
    return R"(event {"data":{")" + path + "\":" + kAllChange + R"(},"event":131072,"path":")" + fullPath + "\"}";
}

std::vector<std::string> Cleaning(const std::string &share) {
    const std::string data = share + "/@eaDir/VORK@";
    return {"exec /bin/rm -rf " + data + "file_index_queue", "exec /bin/rm -rf " + data + "file_index_queue.tmp",
            "exec /bin/rm -rf " + data + ".fileindexdb"};
}

/// /music/a goes with its share, /photo/a leaves /photo/b behind.
const std::string kRequest = R"(["/photo/a","/music/a"])";

std::vector<std::string> Steps() {
    std::vector<std::string> steps = {"saved folder.conf", Command("/photo/a"), Command("/music/a"),
                                      Event("/music/a", "/vol2/music/a"), Event("/photo/a", "/vol1/photo/a")};
    for (const std::string &step : Cleaning("/vol2/music")) {
        steps.push_back(step);
    }
    steps.emplace_back("unmonitor fileindex 1 /vol2/music/@eaDir/VORK@file_index_queue");
    steps.emplace_back(
        R"(monitor fileindex 1 {"config":[{"ignore":["@eaDir"],"mask":65486,"path":"/vol1/photo/b"}],)"
        R"("queue":"/vol1/photo/@eaDir/VORK@file_index_queue"})");
    return steps;
}

class IndexDelete : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
        GivenFolders({FolderRecord("/music/a", "", "a"), FolderRecord("/photo/a", "", "d"),
                      FolderRecord("/photo/b", "", "p")});
        Platform::Current().searchOn = true;
        daemon_.Start();
    }
    static bool Delete(const std::string &request) { return IndexMgr::Delete(Parse(request)); }
    static std::vector<std::string> Locked(std::vector<std::string> steps) {
        steps.insert(steps.begin(), "lock folder exclusive");
        steps.emplace_back("unlock folder");
        return steps;
    }
};

TEST_F(IndexDelete, SavesTellsTheDaemonAndThenTheMonitors) {
    EXPECT_TRUE(Delete(kRequest));
    EXPECT_EQ(Locked(Steps()), Journal());
    EXPECT_EQ("{" + FolderRecord("/photo/b", "", "p") + "}", FolderConf());
    EXPECT_EQ("", Left());
    EXPECT_FALSE(fs::exists("/vol2/music/@eaDir/VORK@.fileindexdb"));
    EXPECT_EQ(1U, Queue("photo").size());
}

TEST_F(IndexDelete, OfTheLastFolderStopsTheDaemonInsteadOfTellingIt) {
    GivenFolders({FolderRecord("/music/a", "", "a")});
    std::vector<std::string> steps = {"saved folder.conf", "stop fileindexd 1", "search 0", "restart samba"};
    for (const std::string &step : Cleaning("/vol2/music")) {
        steps.push_back(step);
    }
    steps.emplace_back("unmonitor fileindex 1 /vol2/music/@eaDir/VORK@file_index_queue");
    EXPECT_TRUE(Delete(R"(["/music/a"])"));
    EXPECT_EQ(Locked(steps), Journal());
    EXPECT_EQ("{}", FolderConf());
    Forget();
    EXPECT_TRUE(Delete("[]"));
    EXPECT_THAT(Journal(),
                ElementsAre("lock folder exclusive", "saved folder.conf", "stop fileindexd 1", "unlock folder"))
        << "the search setting is off already";
}

TEST_F(IndexDelete, OfTheLastFolderIgnoresFailingServices) {
    const struct {
        const char *call;
        int line;
        bool restarted;
    } rows[] = {
        {"VLIBServiceStop", 89, true}, {"VORKSMBSetSpotlight", 94, false}, {"VLIBServiceRestart", 96, false}};
    for (const auto &row : rows) {
        Forget();
        GivenFolders({FolderRecord("/music/a", "", "a")});
        Platform::Current().searchOn = true;
        Fail({.call = row.call, .error = 0x1500});
        EXPECT_TRUE(Delete(R"(["/music/a"])"));
        EXPECT_EQ(
            "0 index_mgr.cpp:" + std::to_string(row.line) + " " + row.call + " failed: err=[0x1500 platform.c:77]",
            Left());
        EXPECT_EQ(row.restarted, testing::Value(Journal(), testing::Contains("restart samba")));
        EXPECT_EQ(1, Script::Current().Calls("MonitorQueue::Delete"));
    }
}

TEST_F(IndexDelete, OfAPathThatIsNotIndexedGoesThroughAllSteps) {
    EXPECT_TRUE(Delete(R"(["/photo/none"])"));
    EXPECT_THAT(SentCommands(),
                ElementsAre(R"({"data":{"folder_path":"/photo/none"},"type":"delete_folder_setting"})"));
    EXPECT_THAT(Queue("photo"), ElementsAre(std::string(R"({"data":{"/photo/none":)") + kAllChange +
                                            R"(},"event":131072,"path":"/vol1/photo/none"})"));
    EXPECT_EQ(3U, Parse(FolderConf()).size());
    EXPECT_EQ(1, Script::Current().Calls("MonitorQueue::Upsert"));
}

TEST_F(IndexDelete, OfAMalformedRequestChangesNothing) {
    const std::string conf = ReadFile(kFolderConf);
    const struct {
        const char *request, *culprit;
    } rows[] = {{R"("/photo/a")", R"("/photo/a")"},
                {R"({"path":"/photo/a"})", R"({"path":"/photo/a"})"},
                {"null", "null"},
                {R"(["/photo/a",5])", "5"},
                {R"(["/photo/a",null])", "null"},
                {R"([["/photo/a"]])", R"(["/photo/a"])"}};
    for (const auto &row : rows) {
        Forget();
        EXPECT_FALSE(Delete(row.request));
        EXPECT_EQ(std::string("1 index_mgr.cpp:61 Bad param: ") + row.culprit, Left());
        EXPECT_EQ(conf, ReadFile(kFolderConf));
        EXPECT_THAT(Journal(), testing::Not(testing::Contains("saved folder.conf")));
        EXPECT_FALSE(IsLocked(kFolderLock));
    }
}

/// Done when the last event is written: after the commands and before the shares are gone through.
std::function<void()> AfterTheEvents(const std::function<void()> &action) {
    return
        [action] { Script::Current().Fail({.call = "write", .about = "/vol1/photo/@eaDir", .action = action}); };
}

const FailingStep kFailingSteps[] = {
    {"LockBusy", WillFail({.call = "flock", .about = kFolderLock, .times = 3, .error = EAGAIN}), 0, kBusy},
    {"ListNotToBeRead", WillFail({.call = "open", .about = kFolderConf}), 0, kFolderConfUnreadable},
    {"ListNotToBeSaved", WillFail({.call = "write", .about = kFolderConf}), 0, kFolderConfUnwritable},
    {"SecondCommand", WillFail({.call = "connect", .nth = 2}), 2,
     "0 index_mgr.cpp:104 SendCammandToDaemon failed"},
    {"SecondEvent", WillFail({.call = "open", .about = "/vol1/photo/@eaDir"}), 4,
     "0 index_mgr.cpp:436 AddCustomEvent failed | index_mgr.cpp:111 Update failed"},
    {"ShareGoneBeforeItsCleaning", AfterTheEvents([] { Platform::Current().shares.erase("music"); }), 5,
     "0 utils.cpp:772 VORKShareGet failed, name=music, code=5120 | "
     "index_mgr.cpp:653 FILEIDXQueuePathGet failed, share=music | "
     "index_mgr.cpp:126 CleanShareIndexData failed, share=music"},
    {"Withdrawal", WillFail({.call = "MonitorQueue::Delete"}), 8,
     "0 index_mgr.cpp:350 MonitorQueue::Delete failed | index_mgr.cpp:130 DeleteVorkNtifydCfg failed, "
     "share=music"},
    {"Registration", WillFail({.call = "MonitorQueue::Upsert"}), 9,
     "0 index_mgr.cpp:324 MonitorQueue::Add failed | index_mgr.cpp:121 UpsertVorkNotifydCfg failed, share=photo"},
};

class IndexDeleteStep : public IndexDelete, public testing::WithParamInterface<FailingStep> {};

TEST_P(IndexDeleteStep, ThatFailsStopsWhatFollowsAndTheRequestRepeatedRepairsIt) {
    const FailingStep &step = GetParam();
    const std::string conf = ReadFile(kFolderConf);
    step.arrange();
    EXPECT_FALSE(Delete(kRequest));
    EXPECT_EQ(step.left, Left());
    ExpectOnlyTheFirst(step.done, Steps());
    EXPECT_EQ(step.done == 0 ? Canonical(conf) : "{" + FolderRecord("/photo/b", "", "p") + "}", FolderConf());
    EXPECT_FALSE(IsLocked(kFolderLock));

    EXPECT_THAT(Script::Current().Finish(), IsEmpty());
    GivenShare("music", "/vol2/music");
    Forget();
    EXPECT_TRUE(Delete(kRequest));
    EXPECT_EQ("{" + FolderRecord("/photo/b", "", "p") + "}", FolderConf());
    EXPECT_EQ("", Left());
}

INSTANTIATE_TEST_SUITE_P(Of, IndexDeleteStep, testing::ValuesIn(kFailingSteps),
                         [](const auto &info) { return info.param.name; });

TEST_F(IndexDelete, NeverCleansAShareThatTheSavedListStillHolds) {
    fs::create_directories("/vol1/photo/@eaDir/VORK@.fileindexdb");
    AfterTheEvents([] { Fail({.call = "open", .about = kFolderConf, .times = kAlways, .error = EIO}); })();
    EXPECT_FALSE(Delete(R"(["/photo/a"])"));
    EXPECT_TRUE(fs::exists("/vol1/photo/@eaDir/VORK@.fileindexdb"));
    EXPECT_EQ(1U, Queue("photo").size());
    EXPECT_EQ(0, Script::Current().Calls("VLIBCExec"));
    EXPECT_EQ(0, Script::Current().Calls("MonitorQueue::Delete"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:121 UpsertVorkNotifydCfg failed, share=photo"));
}

TEST_F(IndexDelete, OfAVanishedShareSavesButCannotQueueItsEvent) {
    Platform::Current().shares.erase("music");
    EXPECT_FALSE(Delete(R"(["/music/a"])"));
    EXPECT_EQ("2 index_mgr.cpp:430 GetFullPath failed, path=/music/a | index_mgr.cpp:111 Update failed", Left());
    EXPECT_EQ(2U, Parse(FolderConf()).size());
    EXPECT_FALSE(Delete(R"([""])"));
    EXPECT_THAT(Left(), testing::EndsWith(" | index_mgr.cpp:79 GetShareNameByPath failed, path="));
}

class IndexReindex : public IndexDelete {
protected:
    static bool Reindex(const std::string &request) { return IndexMgr::Reindex(Parse(request)); }
};

TEST_F(IndexReindex, RevivesSharesAndQueuesOneEventForEachPath) {
    GivenStatusConf(R"({"no_space":{"photo":true,"other":true}})");
    EXPECT_TRUE(Reindex(R"(["/photo/b","/music","/photo/a"])"));
    EXPECT_THAT(Journal(),
                ElementsAre("lock status exclusive", "saved status.conf",
                            R"(command {"data":{"share_name":"photo"},"type":"revive_share_worker"})",
                            "unlock status", R"(event {"data":null,"event":65536,"path":"/vol1/photo/b"})",
                            R"(event {"data":null,"event":65536,"path":"/vol2/music"})",
                            R"(event {"data":null,"event":65536,"path":"/vol1/photo/a"})"));
    EXPECT_EQ(R"({"no_space":{"other":true}})", StatusConf());
    EXPECT_EQ("", Left());
}

/// The queue's consumer or another writer does something after the first event of a request, before or after the
/// queue has been looked at for the second.
TEST_F(IndexReindex, SeesTheQueueAsItIsAtEachEvent) {
    const std::string queue = "/vol1/photo/@eaDir/VORK@file_index_queue";
    const auto lineOf = [](const std::string &name) {
        return R"({"data":null,"event":65536,"path":"/vol1/photo/)" + name + "\"}";
    };
    const std::string a = lineOf("a");
    const std::string b = lineOf("b");
    const std::string c = lineOf("c");
    const struct {
        const char *name;
        std::function<void()> between;
        std::vector<std::string> lines;
    } rows[] = {
        {"nothing", [] {}, {a, b}},
        {"taken and worked off", [&] { fs::remove(queue); }, {b, a}},
        {"taken", [&] { fs::rename(queue, queue + ".tmp"); }, {b}},
        {"emptied in place", [&] { WriteFile(queue, ""); }, {b, a}},
        {"written anew in place, of the same size", [&] { WriteFile(queue, c + "\n"); }, {c, b, a}},
        {"replaced by a longer one",
         [&] {
             fs::rename(queue, queue + ".old");
             WriteFile(queue, c + "\n" + c + "\n");
         },
         {c, c, b, a}},
        {"appended to", [&] { WriteFile(queue, a + "\n" + c + "\n"); }, {a, c, b}},
    };
    for (const auto &row : rows) {
        for (const int lockCall : {2, 3}) {  // the end of the first lock, the start of the second
            SCOPED_TRACE(row.name);
            fs::remove_all("/vol1/photo/@eaDir");
            Fail({.call = "flock", .about = queue, .nth = lockCall, .action = row.between});
            EXPECT_TRUE(Reindex(R"(["/photo/a","/photo/b","/photo/a","/photo/b"])"));
            EXPECT_EQ(row.lines, Queue("photo")) << lockCall;
            Script::Current().Finish();
        }
    }
}

TEST_F(IndexReindex, GoesOnWhenAShareCannotBeRevived) {
    daemon_.Stop();
    GivenStatusConf(R"({"no_space":{"photo":true}})");
    EXPECT_TRUE(Reindex(R"(["/photo/a"])"));
    EXPECT_EQ(
        "0 status_mgr.cpp:321 SendCammandToDaemon failed | index_mgr.cpp:400 ShareRevice failed, share=photo",
        Left());
    EXPECT_EQ(1U, Queue("photo").size());
}

TEST_F(IndexReindex, ChecksAllPathsBeforeItDoesAnything) {
    GivenStatusConf(R"({"no_space":{"photo":true}})");
    const std::pair<const char *, const char *> rows[] = {
        {R"("/photo/a")", R"(1 index_mgr.cpp:369 Malformed jsArrPath: "/photo/a")"},
        {"{}", "1 index_mgr.cpp:369 Malformed jsArrPath: {}"},
        {R"(["/photo/a",5])", "1 index_mgr.cpp:377 Malformed jsArrPath: 5"},
        {R"(["/photo/a",""])", "0 index_mgr.cpp:384 Failed to get share name from path: "},
        {R"(["/photo/a","/other/x"])", ""},
    };
    for (const auto &[request, left] : rows) {
        EXPECT_FALSE(Reindex(request));
        EXPECT_EQ(left, Left());
        EXPECT_THAT(Journal(), IsEmpty());
    }
    EXPECT_TRUE(Reindex("[]"));
}

TEST_F(IndexReindex, StopsAtThePathThatCannotBeQueued) {
    GivenFolders(
        {FolderRecord("/none/x", "", ""), FolderRecord("/photo/a", "", ""), FolderRecord("/music", "", "")});
    EXPECT_FALSE(Reindex(R"(["/photo/a","/none/x","/music"])"));
    EXPECT_EQ("2 index_mgr.cpp:407 GetFullPath failed, path=/none/x", Left());
    EXPECT_EQ(1U, Queue("photo").size());
    EXPECT_FALSE(fs::exists("/vol2/music/@eaDir"));

    Fail({.call = "open", .about = "/vol2/music/@eaDir"});
    EXPECT_FALSE(Reindex(R"(["/music"])"));
    EXPECT_THAT(Left(), testing::EndsWith("index_mgr.cpp:413 AddCustomEvent failed, path=/music"));
}

}  // namespace
}  // namespace fileindex_test
