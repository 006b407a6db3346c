// Eight processes change both configuration files at once, and some of them are killed.
#include "harness.h"

#include <csignal>

namespace reliability {

namespace {

constexpr int kWorkers = 8;
constexpr int kMaxFolders = 1000;
constexpr int kMaxMarkers = 2000;

struct Board {
    std::array<std::atomic<bool>, kMaxFolders> folders;
    std::array<std::atomic<bool>, kMaxMarkers> markers;
    std::atomic<int> busy;  ///< times an operation was refused because of the lock
};

std::string PathOf(int number) {
    return "/photo/folder " + std::to_string(number);
}

std::string MarkerOf(int number) {
    return "marker " + std::to_string(number);
}

/// Repeats a call that is refused for the lock alone; any other failure is one.
template <typename Call>
void Insist(Board &board, Call call) {
    ErrorHandler::SetError(FILEINDEX_ERR_NONE);
    for (; !call(); ++board.busy) {
        Check(ErrorHandler::GetError() == FILEINDEX_ERR_LOCK, "refused for another reason than the lock");
    }
}

void Work(Board &board, int worker, int firstFolder, int markers) {
    // By turns, so that a worker is killed in either.
    for (int i = worker; i < std::max(kMaxFolders, markers); i += kWorkers) {
        if (i >= firstFolder && i < kMaxFolders && !board.folders[i]) {
            Insist(board, [i] { return IndexMgr::Add(Array(FolderRequest(PathOf(i), "x"))); });
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

/// Starts eight workers, and one anew for each that is killed. Returns the number of kills.
int KillWorkers(int wanted, const std::function<pid_t(int worker)> &start) {
    std::mt19937 random(1);
    std::array<pid_t, kWorkers> team{};
    for (int worker = 0; worker < kWorkers; ++worker) {
        team[worker] = start(worker);
    }
    int kills = 0;
    for (bool finished = false; kills < wanted && !finished;) {
        ::usleep(random() % 100000);  // the instant to kill at, not a wait
        const int worker = static_cast<int>(random() % kWorkers);
        ::kill(team[worker], SIGKILL);
        const int status = Wait(team[worker]);
        Check(status == 0 || status == 128 + SIGKILL, "a worker failed");
        finished = status == 0;
        kills += finished ? 0 : 1;
        team[worker] = start(worker);
    }
    for (const pid_t member : team) {
        Check(Wait(member) == 0, "a worker failed");
    }
    return kills;
}

void CheckBoard(const Board &board, int firstFolder, int markers) {
    Folders folders;
    Status status;
    Check(folders.Load() && status.Load(), "the files");
    Json::Value record;
    for (int i = 0; i < kMaxFolders; ++i) {
        Check(i < firstFolder || board.folders[i], "a folder was not added");
        Check(folders.Get(record, PathOf(i)), "an acknowledged folder is lost");
    }
    for (int i = 0; i < markers; ++i) {
        Check(board.markers[i] && status.IsUpdated(MarkerOf(i)), "an acknowledged marker is lost");
    }
}

}  // namespace

void Adders(const std::string &) {
    MakeMachine();
    const pid_t daemon = StartDaemon();
    const int firstFolder = Rounds(900, 0);
    const int markers = Rounds(200, kMaxMarkers);
    const double begin = Now();
    AddFirst(firstFolder);
    auto &board = Shared<Board>();
    const int kills = KillWorkers(Rounds(15, 200), [&](int worker) {
        return Start([&board, worker, firstFolder, markers] { Work(board, worker, firstFolder, markers); });
    });
    CheckBoard(board, firstFolder, markers);
    const auto before = ReadFile(kFolderConf);
    const auto addOneMore = [] { return IndexMgr::Add(Array(FolderRequest("/photo/one more", "x"))); };
    Check(Fails(addOneMore, FILEINDEX_ERR_EXCEED_MAX_FOLDER), "folder 1001: code 5");
    Check(ReadFile(kFolderConf) == before, "folder 1001 changed the file");
    Kill(daemon);
    Figure(
        "8 processes, %d folders and %d markers | all there; %d killed, lock busy %d times, folder 1001 refused"
        " (%.0f s)",
        kMaxFolders - firstFolder, markers, kills, board.busy.load(), Now() - begin);
}

}  // namespace reliability
