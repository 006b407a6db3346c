// Eight threads of one process call everything at once; the thread sanitizer looks on. And threads that are
// cancelled.
#include "harness.h"

#include <pthread.h>

#include <cstdlib>
#include <optional>
#include <thread>

namespace reliability {

namespace {

constexpr int kThreads = 8;

/// The folder that a thread alone changes: whether it is stored, while that is certain.
struct Own {
    std::string path;
    std::optional<bool> stored = false;
    int changes = 0;

    /// A change may be refused because the lock is busy, or fail after the save.
    void Change(bool done, bool isStored) {
        stored = done ? std::optional(isStored) : std::nullopt;
        changes += done ? 1 : 0;
    }
};

std::vector<std::function<void()>> CallsOf(Own &own) {
    const std::string path = own.path;
    const std::string fullPath = "/vol1" + path;
    return {
        [&own] { own.Change(IndexMgr::Upsert(Array(FolderRequest(own.path, "x"))), true); },
        [&own] { own.Change(IndexMgr::Delete(Array(own.path)), false); },
        [&own] { StatusMgr::ShareSetNoSpace("photo", own.changes % 2 == 0); },
        [] {
            std::vector<Folder> folders;
            Check(!IndexMgr::List(folders) || folders.size() <= kThreads + 1, "a list of strangers");
        },
        [path, json = Json::Value()]() mutable {
            IndexMgr::List(json, 0, 10, "name", "DESC", Array("status", "is_valid"));
            IndexMgr::Get(json, path);
        },
        [text = std::string(), time = 0LL]() mutable {
            StatusMgr::GetStatus(text);
            StatusMgr::GetPauseInfo(time);
        },
        [=] { return IndexMgr::IsPathIndexed(path) && IndexMgr::IsFullPathIndexed(fullPath); },
        [=] { return CanPathBeIndexed(path) && IsShareSpaceEnough("photo"); },
        [=] { return StatusMgr::SetUpdated(path) && StatusMgr::IsUpdated(path); },
        [=] { IndexMgr::Reindex(Array("/photo/always", path)); },
        [=] { AddCustomEvent(2, fullPath, Json::Value()); },
        [] { return StatusMgr::GetFolderStatus("/photo/always"), IndexMgr::ShareResume("photo"); },
        [] { return StatusMgr::Pause(1) && StatusMgr::Resume(); },
        [] { Check(ErrorHandler::GetError() >= FILEINDEX_ERR_NONE, "the code"); },
    };
}

/// Until it is cancelled.
void *CallOn(void *argument) {
    Json::Value record;
    std::array<char, 4096> database{};
    for (;;) {
        FILEIDXDBPathGet("photo", database.data(), database.size());
        StatusMgr::SetUpdated("marker");
        StatusMgr::Pause(1);
        IndexMgr::Get(record, "/photo/always");
        ::pthread_testcancel();
    }
    return argument;
}

}  // namespace

void CancelledThreads(const std::string &) {
    const char *sanitizers = std::getenv("SANITIZE");
    if (sanitizers != nullptr && *sanitizers != '\0') {
        std::puts("skipped: the sanitizers' runtimes do not survive the cancelling of threads");
        std::exit(77);
    }
    MakeMachine();
    const pid_t daemon = StartDaemon();
    Check(IndexMgr::Upsert(Array(FolderRequest("/photo/always", "x"))), "the first folder");
    std::mt19937 random(1);
    const int rounds = Rounds(300, 3000);
    const SameDescriptors same;
    for (int round = 0; round < rounds; ++round) {
        pthread_t thread{};
        Check(::pthread_create(&thread, nullptr, CallOn, nullptr) == 0, "a thread");
        ::usleep(random() % 1000);  // the instant to cancel at, not a wait
        ::pthread_cancel(thread);
        ::pthread_join(thread, nullptr);
        Json::Value record;
        Check(StatusMgr::SetUpdated("after") && IndexMgr::Get(record, "/photo/always"),
              "a lock or a file is lost");
    }
    Kill(daemon);
    Figure("%d cancelled threads | each left, with its locks and descriptors given back", rounds);
}

void Threads(const std::string &) {
    MakeMachine();
    const pid_t daemon = StartDaemon();
    Check(IndexMgr::Upsert(Array(FolderRequest("/photo/always", "x"))), "the first folder");
    const int rounds = Rounds(200, 2000);
    std::array<Own, kThreads> owns;
    std::vector<std::thread> threads;
    for (int i = 0; i < kThreads; ++i) {
        owns[i].path = "/photo/thread " + std::to_string(i);
        threads.emplace_back([calls = CallsOf(owns[i]), i, rounds] {
            std::mt19937 random(i);
            for (int round = 0; round < rounds; ++round) {
                calls[random() % calls.size()]();
            }
        });
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
    Figure("%d threads of mixed calls | %d calls, %d changes of folders done, none lost", kThreads,
           rounds * kThreads, changes);
}

}  // namespace reliability
