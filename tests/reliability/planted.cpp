// What strangers leave in the places that the library opens, and lock files that another user holds.
#include "harness.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <filesystem>

namespace reliability {

namespace {

namespace fs = std::filesystem;

constexpr uid_t kStranger = 65534;
constexpr char kVictim[] = "/vol2/victim";
constexpr char kVictimDir[] = "/vol2/victims";
constexpr char kNowhere[] = "/vol2/nowhere";
constexpr char kMetadata[] = "/vol1/photo/@eaDir";

struct Object {
    const char *name;
    void (*plant)(const char *path);
};

constexpr Object kObjects[] = {
    {"link to a file", [](const char *path) { fs::create_symlink(kVictim, path); }},
    {"link to a directory", [](const char *path) { fs::create_symlink(kVictimDir, path); }},
    {"dangling link", [](const char *path) { fs::create_symlink(kNowhere, path); }},
    {"FIFO", [](const char *path) { Check(::mkfifo(path, 0666) == 0, "mkfifo"); }},
    {"directory", [](const char *path) { fs::create_directory(path); }},
    {"device", [](const char *path) { Check(::mknod(path, S_IFCHR | 0666, makedev(1, 5)) == 0, "mknod"); }},
};

bool ChangeFolders() {
    Folders folders;
    Json::Value report;
    const bool changed = folders.Lock(true) && folders.Load() &&
                         folders.Upsert(report, FolderRequest("/photo/a", "a")) && folders.Save();
    folders.Unlock();
    return changed;
}

bool ReadFolders() {
    std::vector<Folder> folders;
    return IndexMgr::List(folders);
}

bool ChangeStatus() {
    return StatusMgr::SetUpdated("marker");
}

bool MakeDatabase() {
    std::array<char, 4096> path{};
    return FILEIDXDBPathGet("photo", path.data(), path.size()) > 0;
}

bool QueueEvent() {
    return AddCustomEvent(0x20000, "/vol1/photo/a", Json::Value());
}

/// One letter for each object, in their order: does the call succeed? The code is that of its failures.
struct Place {
    std::string path;
    const char *operation;
    bool (*call)();
    const char *results;
    int code;
};

const Place kPlaces[] = {
    {kFolderConf, "change", ChangeFolders, "ffffff", FILEINDEX_ERR_SAVE_JSON},
    {kFolderConf, "read", ReadFolders, "tttttt", 0},  // whatever is no regular file is no configuration yet
    {kStatusConf, "change", ChangeStatus, "ffffff", FILEINDEX_ERR_SAVE_JSON},
    {kStatusConf, "read", [] { return Status().Load(); }, "tttttt", 0},
    {kFolderLock, "change", ChangeFolders, "ffffff", FILEINDEX_ERR_LOCK},
    {kStatusLock, "change", ChangeStatus, "ffffff", FILEINDEX_ERR_LOCK},
    {kQueue, "append", QueueEvent, "ffffff", 0},
    {std::string(kQueue) + ".tmp", "append to its queue", QueueEvent, "tttttt", 0},
    {kMetadata, "append", QueueEvent, "fffftf", 0},
    {kMetadata, "make the database", MakeDatabase, "tttttt", 0},  // told even where it cannot be made
    {kSocket, "send", [] { return SendCammandToDaemon("resume", Json::Value()); }, "ffffff", 0},
};

/// What the objects are and lead to, before and after.
std::string Describe(const std::string &path) {
    struct stat status {};
    Check(::lstat(path.c_str(), &status) == 0, "the planted object is gone: " + path);
    return std::to_string(status.st_ino) + " " + std::to_string(status.st_mode) + " " +
           ReadFile(kVictim).value_or("(gone)") + (fs::is_empty(kVictimDir) ? "" : " a file appeared") +
           (fs::exists(kNowhere) ? " a file was made" : "");
}

/// The seconds that the call took.
double Try(const Place &place, const Object &object, bool succeeds) {
    const std::string what = std::string(object.name) + " at " + place.path + ", " + place.operation;
    MakeMachine();
    WriteFile(kVictim, "{}");
    fs::remove_all(place.path);
    object.plant(place.path.c_str());
    const std::string before = Describe(place.path);
    const SameDescriptors sameDescriptors;
    ::alarm(30);  // a call that hangs ends the run
    const double begin = Now();
    Check(succeeds ? place.call() : Fails(place.call, place.code), what + ": the result");
    const double duration = Now() - begin;
    ::alarm(0);
    Check(Describe(place.path) == before, what + ": something was changed");
    Check(place.path != kQueue || StatusMgr::ShareIsNeedReindex("photo"), what + ": the share is not marked");
    fs::remove_all(place.path);
    return duration;
}

/// Takes both lock files, as a user without any privilege, and keeps them.
pid_t StartStranger() {
    auto &ready = Shared<volatile bool>();
    const pid_t stranger = Start([&ready] {
        Check(::setgid(kStranger) == 0 && ::setuid(kStranger) == 0, "setuid");
        for (const char *path : {kFolderLock, kStatusLock}) {
            // Reading is enough to lock a file that the library made.
            const int fd = ::open(path, O_RDONLY | O_CREAT | O_CLOEXEC, 0600);
            Check(fd >= 0 && ::flock(fd, LOCK_EX) == 0, "lock as a stranger");
        }
        ready = true;
        ::pause();
    });
    while (!ready) {
        ::usleep(1000);
    }
    return stranger;
}

void CallWhileLocked(const char *whose, int calls) {
    double sum = 0;
    double longest = 0;
    const SameDescriptors sameDescriptors;
    for (int i = 0; i < calls; ++i) {
        const double begin = Now();
        Check(Fails(i % 2 == 0 ? ChangeFolders : ChangeStatus, FILEINDEX_ERR_LOCK), "a held lock: code 9");
        sum += Now() - begin;
        longest = std::max(longest, Now() - begin);
        Check(ReadFolders() && Status().Load(), "a reader failed while the lock was held");
    }
    Figure(
        "another user holds %s lock files | %d calls: code 9, readers fine; %.0f ms on average, %.0f ms at most",
        whose, calls, sum / calls * 1000, longest * 1000);
}

}  // namespace

void Planted(const std::string &) {
    fs::create_directories(kVictimDir);
    double longest = 0;
    int cases = 0;
    for (const Place &place : kPlaces) {
        for (const Object &object : kObjects) {
            longest = std::max(longest, Try(place, object, place.results[&object - kObjects] == 't'));
            ++cases;
        }
    }
    Figure("planted links, FIFOs, directories, devices | %d cases: victims unchanged, %.1f ms at most", cases,
           longest * 1000);
}

void ForeignLocks(const std::string &) {
    for (const bool ours : {true, false}) {
        MakeMachine();
        Check(!ours || (ChangeFolders() && ChangeStatus()), "make the lock files");
        const pid_t stranger = StartStranger();
        CallWhileLocked(ours ? "the library's" : "their own", Rounds(100, 1000));
        Kill(stranger);
        // A lock file of a stranger may stay out of reach for good (fs.protected_regular): no demand on those.
        Check(!ours || (ChangeFolders() && ChangeStatus()), "a released lock");
    }
}

}  // namespace reliability
