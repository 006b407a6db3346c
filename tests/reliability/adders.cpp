// Eight processes change both configuration files at once, and some of them are killed.
#include "harness.h"
#include "scenarios.h"

#include <sched.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <csignal>
#include <random>

namespace reliability {

namespace {

using namespace VORK::FILEINDEX;

constexpr int kWorkers = 8;
constexpr int kMaxFolders = 1000;
constexpr int kMaxMarkers = 2000;
constexpr size_t kPage = 4096;

struct Board {
    std::array<std::atomic<bool>, kMaxFolders> folders;
    std::array<std::atomic<bool>, kMaxMarkers> markers;
    /// Held around a write above a page, which is known not to survive a kill, and around a kill.
    std::array<std::atomic<bool>, kWorkers> noKill;
    std::atomic<int> busy;  ///< times an operation was refused because of the lock
};

class Spinlock {
public:
    explicit Spinlock(std::atomic<bool> &taken) : taken_(taken) {
        while (taken_.exchange(true)) {
            ::sched_yield();
        }
    }
    ~Spinlock() { taken_ = false; }
    Spinlock(const Spinlock &) = delete;
    Spinlock &operator=(const Spinlock &) = delete;

private:
    std::atomic<bool> &taken_;
};

std::string PathOf(int number) {
    return "/photo/folder " + std::to_string(number);
}

std::string MarkerOf(int number) {
    return "marker " + std::to_string(number);
}

/// Repeats an operation that is refused for the lock alone; any other failure is one.
template <typename Operation>
void Insist(Board &board, Operation operation) {
    ErrorHandler::SetError(FILEINDEX_ERR_NONE);
    while (!operation()) {
        Check(ErrorHandler::GetError() == FILEINDEX_ERR_LOCK, "refused for another reason than the lock");
        ++board.busy;
    }
}

void Work(Board &board, int worker, int firstFolder, int markers) {
    WriteHook() = [&board, worker](int fd, const void *data, size_t size) {
        if (size <= kPage) {
            return RealWrite(fd, data, size);
        }
        const Spinlock guard(board.noKill[worker]);
        return RealWrite(fd, data, size);
    };
    // By turns, so that a worker is killed in either.
    for (int i = worker; i < std::max(kMaxFolders, markers); i += kWorkers) {
        if (i >= firstFolder && i < kMaxFolders && !board.folders[i]) {
            Insist(board, [i] { return IndexMgr::Add(Array({FolderRequest(PathOf(i), "x")})); });
            board.folders[i] = true;
        }
        if (i < markers && !board.markers[i]) {
            Insist(board, [i] { return StatusMgr::SetUpdated(MarkerOf(i)); });
            board.markers[i] = true;
        }
    }
}

/// One batch, so that the rest can be added one by one.
void AddFirst(int count) {
    Json::Value request(Json::arrayValue);
    for (int i = 0; i < count; ++i) {
        request.append(FolderRequest(PathOf(i), "x"));
    }
    Check(count == 0 || IndexMgr::Add(request), "the first folders");
}

using Team = std::array<pid_t, kWorkers>;

/// False when the worker had finished already.
bool KillWorker(Board &board, Team &team, int worker) {
    const Spinlock guard(board.noKill[worker]);
    ::kill(team[worker], SIGKILL);
    const int status = Wait(team[worker]);
    Check(status == 0 || status == 128 + SIGKILL, "a worker failed");
    team[worker] = 0;
    return status != 0;
}

void CheckBoard(const Board &board, int firstFolder, int markers) {
    Folders folders;
    Check(folders.Load(), "folder.conf");
    Status status;
    Check(status.Load(), "status.conf");
    Json::Value record;
    for (int i = 0; i < kMaxFolders; ++i) {
        Check(i < firstFolder || board.folders[i], "a folder was not added");
        Check(folders.Get(record, PathOf(i)), "an acknowledged folder is lost");
    }
    for (int i = 0; i < markers; ++i) {
        Check(board.markers[i] && status.IsUpdated(MarkerOf(i)), "an acknowledged marker is lost");
    }
}

void RefuseOneMore() {
    const auto before = ReadFile(kFolderConf);
    Check(Fails([] { return IndexMgr::Add(Array({FolderRequest("/photo/one more", "x")})); },
                FILEINDEX_ERR_EXCEED_MAX_FOLDER),
          "folder 1001: code 5");
    Check(ReadFile(kFolderConf) == before, "folder 1001 changed the file");
}

}  // namespace

void Adders() {
    MakeMachine();
    const pid_t daemon = StartDaemon();
    const int firstFolder = Rounds(900, 0);
    const int markers = Rounds(200, kMaxMarkers);
    const int wanted = Rounds(15, 200);
    const Stopwatch stopwatch;
    std::mt19937 random(1);
    AddFirst(firstFolder);
    auto &board = Shared<Board>();
    const auto start = [&](int worker) {
        return Start([&board, worker, firstFolder, markers] { Work(board, worker, firstFolder, markers); });
    };
    Team team{};
    for (int worker = 0; worker < kWorkers; ++worker) {
        team[worker] = start(worker);
    }
    int kills = 0;
    for (; kills < wanted; ++kills) {
        ::usleep(random() % 100000);  // the instant to kill at, not a wait
        const int worker = static_cast<int>(random() % kWorkers);
        if (!KillWorker(board, team, worker)) {
            break;
        }
        team[worker] = start(worker);
    }
    for (const pid_t member : team) {
        Check(member == 0 || Wait(member) == 0, "a worker failed");
    }
    CheckBoard(board, firstFolder, markers);
    RefuseOneMore();
    Kill(daemon);
    Figure("8 processes, " + std::to_string(kMaxFolders - firstFolder) + " folders and " +
               std::to_string(markers) + " markers",
           "all there; " + std::to_string(kills) + " killed, lock busy " + std::to_string(board.busy) +
               " times, folder 1001 refused (" +
               std::to_string(static_cast<int>(stopwatch.Milliseconds() / 1000)) + " s)");
}

}  // namespace reliability
