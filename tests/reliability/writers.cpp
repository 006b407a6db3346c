// Saving the list while the disk is full; and while many change and read it, all of whom are killed again and
// again.
#include "harness.h"

#include <algorithm>

namespace reliability {

namespace {

namespace fs = std::filesystem;

constexpr int kWriters = 3;
constexpr int kFoldersOfEach = 3;

struct Board {
    std::array<std::atomic<int>, kWriters> saved;  ///< the last version of each writer that was acknowledged
    std::atomic<int> busy;                         ///< times a change was refused because of the lock
    std::atomic<int> reads;
};

std::string PathOf(int writer, int folder) {
    return "/photo/" + std::to_string(writer) + "/" + std::to_string(folder);
}

/// "VERSION xxx", of a length that goes up and down with the version.
std::string NameOf(int version, int size) {
    return std::to_string(version) + " " +
           std::string(version * 7919 % size, static_cast<char>('a' + version % 26));
}

/// Gives all folders of the writer another name, in one save.
bool Rename(int writer, const std::string &name) {
    Folders folders;
    Json::Value report;
    bool done = folders.Lock(true) && folders.Load();
    for (int i = 0; done && i < kFoldersOfEach; ++i) {
        done = folders.Upsert(report, FolderRequest(PathOf(writer, i), name));
    }
    done = done && folders.Save();
    folders.Unlock();
    return done;
}

void RenameForEver(Board &board, int writer, int size) {
    for (;;) {
        const int version = board.saved[writer] + 1;
        // A busy lock is the one reason to be refused.
        for (; !Rename(writer, NameOf(version, size)); ++board.busy) {
            Check(ErrorHandler::GetError() == FILEINDEX_ERR_LOCK, "refused for another reason than the lock");
            ErrorHandler::SetError(FILEINDEX_ERR_NONE);
        }
        board.saved[writer] = version;
    }
}

/// Each writer's folders are one version, no older than what was acknowledged before.
void CheckList(Board &board, int size) {
    std::array<int, kWriters> saved{};
    std::copy(board.saved.begin(), board.saved.end(), saved.begin());
    Folders list;
    Check(list.Load(), "the list is broken");
    for (int writer = 0; writer < kWriters; ++writer) {
        Json::Value folder;
        const bool isListed = list.Get(folder, PathOf(writer, 0));
        const std::string name = folder["name"].asString();
        const int version = isListed ? std::stoi(name) : 0;
        Check(version >= saved[writer], "an acknowledged save is lost");
        for (int i = 0; i < kFoldersOfEach; ++i) {
            Check(list.Get(folder, PathOf(writer, i)) == isListed, "half a list");
            Check(!isListed || folder["name"] == NameOf(version, size), "a mixture");
        }
    }
    ++board.reads;
}

void RunAndKill(Board &board, int size, unsigned microseconds) {
    std::vector<pid_t> processes;
    processes.reserve(kWriters + 2);
    for (int writer = 0; writer < kWriters; ++writer) {
        processes.push_back(Start([&board, writer, size] { RenameForEver(board, writer, size); }));
    }
    for (int reader = 0; reader < 2; ++reader) {
        processes.push_back(Start([&board, size] {
            for (;;) {
                CheckList(board, size);
            }
        }));
    }
    ::usleep(microseconds);  // the instant to kill at, not a wait
    std::for_each(processes.begin(), processes.end(), Kill);
    CheckList(board, size);
}

/// Fills the file system but for a few blocks.
void FillDisk(const std::string &path, std::uintmax_t blocksLeft) {
    constexpr std::uintmax_t kBlock = 4096;
    while (std::ofstream(path, std::ios::app) << std::string(kBlock, 'x') << std::flush) {
    }
    const std::uintmax_t blocks = fs::file_size(path) / kBlock;
    fs::resize_file(path, (blocks - std::min(blocks, blocksLeft)) * kBlock);
}

}  // namespace

void Writers(const std::string &fileSystem) {
    MakeMachine();
    const int rounds = Rounds(60, 1000);
    std::mt19937 random(1);
    auto &board = Shared<Board>();
    int versions = 0;
    for (int round = 0; round < rounds; ++round) {
        // Every third round begins without a file, and changes how long the list may be.
        constexpr std::array kSizes = {100, 4000, 40000};
        if (round % kSizes.size() == 0) {
            ::unlink(kFolderConf);
            std::for_each(board.saved.begin(), board.saved.end(),
                          [&](auto &saved) { versions += saved.exchange(0); });
        }
        RunAndKill(board, kSizes[round / 3 % kSizes.size()], random() % (round % 4 == 0 ? 200000 : 20000));
    }
    Figure(
        "3 writers, 2 unlocked readers, %s | %d killed: %d saves acknowledged, none lost; %d reads, each whole;"
        " lock busy %d times",
        fileSystem.c_str(), rounds * 5, versions, board.reads.load(), board.busy.load());
    Check(versions > rounds / 4 && board.reads > rounds && board.busy > 0, "hardly anything was done");
}

void FullDisk(const std::string &fileSystem) {
    MakeMachine();
    const std::string directory = fs::path(kFolderConf).parent_path();
    constexpr std::uintmax_t kMetadata = 4096;  // a file system may keep the map of the blocks that were taken
    const int rounds = Rounds(10, 100);
    std::mt19937 random(1);
    int failures = 0;
    for (int round = 0; round < rounds; ++round) {
        ::unlink(kFolderConf);
        Check(round % 2 == 1 || Rename(0, std::string(random() % 10000, 'o')), "save on a disk with room");
        FillDisk(directory + "/filler", random() % 8);
        for (size_t size = 0; size < 70000; size += 1 + random() % 3000) {
            const std::string old = ReadFile(kFolderConf);
            const std::uintmax_t room = fs::space(directory).free;
            const SameDescriptors sameDescriptors;
            ErrorHandler::SetError(FILEINDEX_ERR_NONE);
            if (!Rename(0, std::string(size, 'n'))) {
                ++failures;
                Check(ErrorHandler::GetError() == FILEINDEX_ERR_SAVE_JSON, "a failed save: the code");
                Check(ReadFile(kFolderConf) == old, "a failed save changed the file");
                Check(fs::space(directory).free + kMetadata >= room, "a failed save keeps space");
            }
        }
        ::unlink((directory + "/filler").c_str());
        Check(Rename(0, std::string(30000, 'l')), "save after space returned");
    }
    Check(failures > rounds, "the disk was hardly ever full");
    Figure("full disk, %s | %d failed saves: old bytes each time, then %d good ones", fileSystem.c_str(), failures,
           rounds);
}

}  // namespace reliability
