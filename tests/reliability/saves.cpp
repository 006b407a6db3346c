// Saving a configuration file while the disk is full, while the writer is killed, while others read.
#include "harness.h"
#include "scenarios.h"

#include <sys/statvfs.h>
#include <unistd.h>

#include <atomic>
#include <fstream>
#include <random>

namespace reliability {

namespace {

using namespace VORK::FILEINDEX;

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
        document_["filling"] = std::string(size, FillingOf(number));
        Lock(true);
        const bool saved = Save();
        Unlock();
        return saved;
    }

    static char FillingOf(int number) { return static_cast<char>('a' + number % 26); }
};

constexpr int kUnreadable = -1;
constexpr int kMixed = -2;

/// The number of the document that the text holds whole.
int NumberIn(const std::string &text) {
    const auto document = Parse(text);
    if (!document || !document->isObject()) {
        return kUnreadable;
    }
    const int number = (*document)["number"].asInt();
    const bool fits = (*document)["filling"].asString() ==
                      std::string((*document)["size"].asUInt64(), Document::FillingOf(number));
    return fits ? number : kMixed;
}

unsigned long FreeBlocks() {
    struct statvfs status {};
    Check(::statvfs(kConfigDir, &status) == 0, "statvfs");
    return status.f_bfree;
}

/// Fills the file system but for a few blocks.
void FillDisk(const std::string &path, int blocksLeft) {
    std::ofstream filler(path);
    const std::string block(4096, 'x');
    long size = 0;
    while (filler.write(block.data(), static_cast<std::streamsize>(block.size())).flush()) {
        size += static_cast<long>(block.size());
    }
    Check(::truncate(path.c_str(), std::max(0L, size - 4096L * blocksLeft)) == 0, "truncate");
}

/// Saves ever new documents until it is killed; `saved` is the last one that was acknowledged.
void SaveForEver(std::atomic<int> &saved, size_t maxSize, unsigned seed) {
    std::mt19937 random(seed);
    Document document;
    for (int number = saved + 1;; ++number) {
        Check(document.SaveNumber(number, random() % maxSize), "save");
        saved = number;
    }
}

/// Kills a writer again and again; every third one begins without a file. Returns the number of broken files.
int KillWriters(int kills, size_t maxSize, const std::string &subject) {
    std::mt19937 random(1);
    auto &saved = Shared<std::atomic<int>>();
    int unreadable = 0;
    int mixed = 0;
    for (int kill = 0; kill < kills; ++kill) {
        if (kill % 3 == 0) {
            ::unlink(kFolderConf);
            saved = 0;
        }
        const unsigned seed = random();
        const pid_t writer = Start([&] { SaveForEver(saved, maxSize, seed); });
        ::usleep(random() % 3000);  // the instant to kill at, not a wait
        Kill(writer);
        const auto text = ReadFile(kFolderConf);
        const int number = text ? NumberIn(*text) : 0;
        unreadable += number == kUnreadable ? 1 : 0;
        mixed += number == kMixed ? 1 : 0;
        if (number < 0) {
            ::unlink(kFolderConf);
            saved = 0;
        }
        Check(number < 0 || number >= saved, "an acknowledged save is lost");
    }
    Figure("kill -9 while saving " + subject, std::to_string(kills) + " kills: " + std::to_string(unreadable) +
                                                  " unreadable, " + std::to_string(mixed) + " mixed");
    return unreadable + mixed;
}

/// Both states of a list in which all names are alike.
void FillList(Folders &folders, int count, const std::string &name) {
    Json::Value report;
    for (int i = 0; i < count; ++i) {
        Check(folders.Upsert(report, FolderRequest("/photo/" + std::to_string(i), name)), "upsert");
    }
}

void FlipForEver(Folders &one, Folders &other) {
    for (;;) {
        for (Folders *folders : {&one, &other}) {
            while (!folders->Lock(true)) {
                folders->Unlock();
            }
            Check(folders->Save(), "save");
            folders->Unlock();
        }
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
    const Stopwatch stopwatch;
    Folders one;
    Folders other;
    FillList(one, count, "short");
    FillList(other, count, "a longer name");
    Check(one.Save(), "save");
    const pid_t writers[] = {Start([&] { FlipForEver(one, other); }), Start([&] { FlipForEver(other, one); })};
    std::vector<pid_t> readers;
    readers.reserve(kReaders);
    for (int i = 0; i < kReaders; ++i) {
        readers.push_back(Start([&] { ReadStates(reads / kReaders, count); }));
    }
    for (const pid_t reader : readers) {
        Check(Wait(reader) == 0, "a reader failed");
    }
    for (const pid_t writer : writers) {
        Kill(writer);
    }
    Figure("4 unlocked readers, 2 writers, " + std::to_string(count) + " folders",
           std::to_string(reads) + " reads: 0 failures, 0 mixtures (" +
               std::to_string(static_cast<int>(stopwatch.Milliseconds() / 1000)) + " s)");
}

}  // namespace

void FullDisk(const std::string &fileSystem) {
    const std::string filler = std::string(kConfigDir) + "/filler";
    constexpr unsigned long kBlocksOfMetadata = 4;  // a file system may keep the map of what was reserved
    const int rounds = Rounds(10, 100);
    std::mt19937 random(1);
    int failures = 0;
    for (int round = 0; round < rounds; ++round) {
        Document document;
        ::unlink(kFolderConf);
        Check(round % 2 == 1 || document.SaveNumber(0, random() % 30000), "save on a disk with room");
        FillDisk(filler, static_cast<int>(random() % 8));
        for (size_t size = 0; size < 200000; size += 1 + random() % 8192) {
            const auto old = ReadFile(kFolderConf);
            const unsigned long room = FreeBlocks();
            const SameDescriptors sameDescriptors;
            if (!Fails([&] { return document.SaveNumber(round, size); }, FILEINDEX_ERR_SAVE_JSON)) {
                Check(NumberIn(ReadFile(kFolderConf).value_or("")) == round, "neither failed nor saved");
                continue;
            }
            ++failures;
            Check(ReadFile(kFolderConf) == old, "a failed save changed the file");
            Check(FreeBlocks() + kBlocksOfMetadata >= room, "a failed save keeps space");
        }
        ::unlink(filler.c_str());
        Check(document.SaveNumber(round, 100000), "save after space returned");
    }
    Check(failures > rounds, "the disk was hardly ever full");
    Figure("full disk, " + fileSystem, std::to_string(failures) + " failed saves: old bytes each time, then " +
                                           std::to_string(rounds) + " good ones");
}

void Kills(const std::string &fileSystem) {
    Check(KillWriters(Rounds(500, 10000), 3900, "up to 4 KiB, " + fileSystem) == 0,
          "a kill broke a file within a page");
    // Above a page the one write can be cut: counted, not demanded.
    KillWriters(Rounds(100, 2000), 153600, "up to 150 KiB, " + fileSystem);
}

void Readers() {
    MakeMachine();
    ReadWhileFlipping(100, Rounds(4000, 80000));
    ReadWhileFlipping(1000, Rounds(200, 5000));
}

}  // namespace reliability
