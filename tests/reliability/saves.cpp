// Saving a configuration file while the disk is full, while the writer is killed, while others read.
#include "harness.h"

#include <fcntl.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>

namespace reliability {

namespace {

namespace fs = std::filesystem;

constexpr int kUnreadable = -1;
constexpr int kMixed = -2;

/// folder.conf with a document whose parts must fit each other: its number and as much filling as it says.
class Document : public Config {
public:
    bool Load() override { return LoadJson(); }
    bool Save() override { return SaveJson(); }
    std::string GetLockPath() const override { return kFolderLock; }
    std::string GetPath() const override { return kFolderConf; }

    bool SaveNumber(int number, size_t size) {
        document_["number"] = number;
        document_["size"] = static_cast<Json::UInt64>(size);
        document_["filling"] = Filling(number, size);
        Lock(true);
        const bool saved = Save();
        Unlock();
        return saved;
    }

    /// 0 without a file.
    [[nodiscard]] int Number() const {
        const int number = document_["number"].asInt();
        return number == 0 || document_["filling"] == Filling(number, document_["size"].asUInt64()) ? number
                                                                                                    : kMixed;
    }

    static std::string Filling(int number, size_t size) {
        return std::string(size, static_cast<char>('a' + number % 26));
    }
};

/// The number of the document that is loaded whole; 0 without a file.
int NumberInFile() {
    Document document;
    return document.Load() ? document.Number() : kUnreadable;
}

/// Fills the file system but for a few blocks.
void FillDisk(const std::string &path, std::uintmax_t blocksLeft) {
    constexpr std::uintmax_t kBlock = 4096;
    while (std::ofstream(path, std::ios::app) << std::string(kBlock, 'x') << std::flush) {
    }
    const std::uintmax_t blocks = fs::file_size(path) / kBlock;
    fs::resize_file(path, (blocks - std::min(blocks, blocksLeft)) * kBlock);
}

/// Kills a writer again and again; every third one begins without a file. Returns the number of broken files.
int KillWriters(int kills, unsigned maxSize, const std::string &subject) {
    std::mt19937 random(1);
    auto &saved = Shared<std::atomic<int>>();  // the last document that was acknowledged
    int unreadable = 0;
    int mixed = 0;
    for (int kill = 0, number = 0; kill < kills; ++kill) {
        if (kill % 3 == 0 || number < 0) {
            ::unlink(kFolderConf);
            saved = 0;
        }
        const pid_t writer = Start([&saved, maxSize, seed = random()] {
            std::mt19937 sizes(seed);
            Document document;
            for (int next = saved + 1;; saved = next++) {
                Check(document.SaveNumber(next, sizes() % maxSize), "save");
            }
        });
        ::usleep(random() % 3000);  // the instant to kill at, not a wait
        Kill(writer);
        number = NumberInFile();
        unreadable += number == kUnreadable ? 1 : 0;
        mixed += number == kMixed ? 1 : 0;
        Check(number < 0 || number >= saved, "an acknowledged save is lost");
    }
    Figure("kill -9 while saving %s | %d kills: %d unreadable, %d mixed", subject.c_str(), kills, unreadable,
           mixed);
    return unreadable + mixed;
}

/// Saves two states of the list by turns; in each all names are alike.
void FlipForEver(int count, const std::array<std::string, 2> &names) {
    std::array<Folders, 2> states;
    Json::Value report;
    for (int i = 0; i < 2 * count; ++i) {
        const Json::Value request = FolderRequest("/photo/" + std::to_string(i / 2), names[i % 2]);
        Check(states[i % 2].Upsert(report, request), "upsert");
    }
    for (int turn = 0;; ++turn) {
        Folders &folders = states[turn % 2];
        while (!folders.Lock(true)) {
            folders.Unlock();
        }
        Check(folders.Save(), "save");
        folders.Unlock();
    }
}

void ReadStates(int reads, int count) {
    for (int i = 0; i < reads; ++i) {
        std::vector<Folder> folders;
        Check(IndexMgr::List(folders), "a read failed");
        Check(folders.size() == static_cast<size_t>(count), "a read found half a list");
        for (const Folder &folder : folders) {
            Check(folder.name == folders.front().name, "a read found a mixture");
        }
    }
}

void ReadWhileFlipping(int count, int reads) {
    constexpr int kReaders = 4;
    const double begin = Now();
    ::unlink(kFolderConf);
    const pid_t writers[] = {Start([=] {
                                 FlipForEver(count, {"short", "a longer name"});
                             }),
                             Start([=] {
                                 FlipForEver(count, {"a longer name", "short"});
                             })};
    while (!ReadFile(kFolderConf)) {
        ::usleep(1000);
    }
    std::array<pid_t, kReaders> readers{};
    for (pid_t &reader : readers) {
        reader = Start([=] { ReadStates(reads / kReaders, count); });
    }
    for (const pid_t reader : readers) {
        Check(Wait(reader) == 0, "a reader failed");
    }
    for (const pid_t writer : writers) {
        Kill(writer);
    }
    Figure("4 unlocked readers, 2 writers, %d folders | %d reads: 0 failures, 0 mixtures (%.0f s)", count, reads,
           Now() - begin);
}

}  // namespace

void FullDisk(const std::string &fileSystem) {
    const std::string filler = std::string(kConfigDir) + "/filler";
    constexpr std::uintmax_t kMetadata = 4096;  // a file system may keep the map of the blocks that were taken
    const int rounds = Rounds(10, 100);
    std::mt19937 random(1);
    int failures = 0;
    for (int round = 0; round < rounds; ++round) {
        Document document;
        ::unlink(kFolderConf);
        Check(round % 2 == 1 || document.SaveNumber(0, random() % 30000), "save on a disk with room");
        FillDisk(filler, random() % 8);
        for (size_t size = 0; size < 200000; size += 1 + random() % 8192) {
            const auto old = ReadFile(kFolderConf);
            const std::uintmax_t room = fs::space(kConfigDir).free;
            const SameDescriptors sameDescriptors;
            if (!Fails([&] { return document.SaveNumber(round, size); }, FILEINDEX_ERR_SAVE_JSON)) {
                Check(NumberInFile() == round, "neither failed nor saved");
                continue;
            }
            ++failures;
            Check(ReadFile(kFolderConf) == old, "a failed save changed the file");
            Check(fs::space(kConfigDir).free + kMetadata >= room, "a failed save keeps space");
        }
        ::unlink(filler.c_str());
        Check(document.SaveNumber(round, 100000), "save after space returned");
    }
    Check(failures > rounds, "the disk was hardly ever full");
    Figure("full disk, %s | %d failed saves: old bytes each time, then %d good ones", fileSystem.c_str(), failures,
           rounds);
}

/// What durability costs: a save beside one write and one flush of a file of the same size.
void Cost(const std::string &fileSystem) {
    const int rounds = Rounds(20, 200);
    for (const size_t size : {12000U, 120000U}) {
        Document document;
        Check(document.SaveNumber(0, size), "save");
        double begin = Now();
        for (int i = 1; i <= rounds; ++i) {
            Check(document.SaveNumber(i, size), "save");
        }
        const double saves = Now() - begin;
        const std::string text = ReadFile(kFolderConf).value_or("");
        const int fd = ::open(kFolderConf, O_RDWR | O_CLOEXEC);
        begin = Now();
        for (int i = 0; i < rounds; ++i) {
            Check(::pwrite(fd, text.data(), text.size(), 0) > 0 && ::fdatasync(fd) == 0, "write and flush");
        }
        const double flushes = Now() - begin;
        ::close(fd);
        Figure("a durable save of %zu KB, %s | %.2f ms; one write and one flush of as much %.2f ms", size / 1000,
               fileSystem.c_str(), saves / rounds * 1000, flushes / rounds * 1000);
    }
}

void Kills(const std::string &fileSystem) {
    // As much as 30, 100 and 1,000 folders take.
    for (const unsigned size : {3900U, 12000U, 120000U}) {
        const std::string subject = "up to " + std::to_string(size / 1000) + " KB, " + fileSystem;
        Check(KillWriters(Rounds(200, 10000), size, subject) == 0, "a kill broke a file");
    }
}

void Readers(const std::string &) {
    MakeMachine();
    ReadWhileFlipping(100, Rounds(4000, 80000));
    ReadWhileFlipping(1000, Rounds(200, 5000));
}

}  // namespace reliability
