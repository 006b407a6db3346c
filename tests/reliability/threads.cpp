// Eight threads of one process call everything at once; the thread sanitizer looks on.
#include "harness.h"
#include "scenarios.h"

#include <array>
#include <atomic>
#include <optional>
#include <random>
#include <thread>

namespace reliability {

namespace {

using namespace VORK::FILEINDEX;

constexpr int kThreads = 8;

/// What a thread knows of the folder that nobody else changes: whether it is stored, while that is certain.
struct Own {
    std::string path;
    std::optional<bool> stored = false;
    int changes = 0;

    /// A change may be refused because the lock is busy, or fail behind the save.
    void Change(bool done, bool isStored) {
        stored = done ? std::optional(isStored) : std::nullopt;
        changes += done ? 1 : 0;
    }
};

void CallOne(unsigned which, Own &own) {
    std::vector<Folder> folders;
    std::string text;
    long long time = 0;
    Json::Value json;
    const std::string fullPath = "/vol1" + own.path;
    switch (which) {
        case 0:
            return own.Change(IndexMgr::Upsert(Array({FolderRequest(own.path, "x")})), true);
        case 1:
            return own.Change(IndexMgr::Delete(Array({own.path})), false);
        case 2:
            return Check(!IndexMgr::List(folders) || folders.size() <= kThreads + 1, "a list of strangers");
        case 3:
            return static_cast<void>(IndexMgr::List(json, 0, 10, "name", "DESC", Array({"status", "is_valid"})));
        case 4:
            return static_cast<void>(IndexMgr::IsPathIndexed(own.path) && IndexMgr::IsFullPathIndexed(fullPath));
        case 5:
            return static_cast<void>(StatusMgr::GetStatus(text));
        case 6:
            return static_cast<void>(StatusMgr::GetFolderStatus("/photo/always"));
        case 7:
            return static_cast<void>(StatusMgr::Pause(1));
        case 8:
            return static_cast<void>(StatusMgr::Resume());
        case 9:
            return static_cast<void>(IndexMgr::Reindex(Array({"/photo/always", own.path})));
        case 10:
            return static_cast<void>(StatusMgr::ShareSetNoSpace("photo", own.changes % 2 == 0));
        case 11:
            return static_cast<void>(StatusMgr::GetPauseInfo(time));
        case 12:
            return static_cast<void>(IndexMgr::ShareResume("photo"));
        case 13:
            return static_cast<void>(IndexMgr::Get(json, own.path));
        case 14:
            return static_cast<void>(AddCustomEvent(2, fullPath, Json::Value()));
        case 15:
            return static_cast<void>(CanPathBeIndexed(own.path) && IsShareSpaceEnough("photo"));
        case 16:
            return static_cast<void>(StatusMgr::SetUpdated(own.path) && StatusMgr::IsUpdated(own.path));
        default:
            return Check(ErrorHandler::GetError() >= FILEINDEX_ERR_NONE, "the code");
    }
}

void Call(Own &own, unsigned seed, int rounds) {
    constexpr unsigned kCalls = 18;
    std::mt19937 random(seed);
    for (int round = 0; round < rounds; ++round) {
        CallOne(random() % kCalls, own);
    }
}

}  // namespace

void Threads() {
    MakeMachine();
    const pid_t daemon = StartDaemon();
    Check(IndexMgr::Upsert(Array({FolderRequest("/photo/always", "x")})), "the first folder");
    const int rounds = Rounds(200, 2000);
    std::array<Own, kThreads> owns;
    std::vector<std::thread> threads;
    for (int i = 0; i < kThreads; ++i) {
        owns[i].path = "/photo/thread " + std::to_string(i);
        threads.emplace_back([&own = owns[i], i, rounds] { Call(own, i, rounds); });
    }
    for (std::thread &thread : threads) {
        thread.join();
    }
    Kill(daemon);
    Folders folders;
    Status status;
    Check(folders.Load() && status.Load(), "the configuration is broken");
    int changes = 0;
    for (const Own &own : owns) {
        Json::Value record;
        Check(!own.stored || folders.Get(record, own.path) == *own.stored, "a change is lost: " + own.path);
        changes += own.changes;
    }
    Check(changes > kThreads, "hardly anything was changed");
    Figure(std::to_string(kThreads) + " threads of mixed calls", std::to_string(rounds * kThreads) + " calls, " +
                                                                     std::to_string(changes) +
                                                                     " changes of folders done, none lost");
}

}  // namespace reliability
