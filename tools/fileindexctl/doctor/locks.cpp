// The two lock files: are they root's alone, so that nobody else can hold them, and does somebody keep one?
#include "base/unique_fd.h"
#include "doctor/finding.h"
#include "facts/file_locks.h"

#include <fileindex/folders.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

constexpr mode_t kMode = 0600;
constexpr const char *kMade = "+ owner 0:0, mode 0600";

void Make(const std::string &path) {
    if (!UniqueFd(open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, kMode))) {
        throw ErrnoFailure(path, "made");
    }
}

// A link, or an empty file, or one whose content has another name: nothing is lost with the name.
bool LosesNothing(const struct stat &status) {
    return S_ISLNK(status.st_mode) || (S_ISREG(status.st_mode) && (status.st_nlink > 1 || status.st_size == 0));
}

// What is wrong with a file that cannot be mended: others may have it open, and hold it as long as they like.
std::string Defect(const struct stat &status) {
    if (!S_ISREG(status.st_mode)) {
        return S_ISLNK(status.st_mode) ? "a link in the place of a lock file" : "no regular file for a lock";
    }
    return ForeignText(status, "a lock file");
}

// While nobody holds it: the lock is taken, and the name goes before the lock does, so that nobody takes the one
// file after somebody else has taken the other. In /tmp only its owner can exchange it meanwhile, and then for
// something of his own that has no business under this name either.
void Remove(const std::string &path) {
    const UniqueFd file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    struct stat status {};
    if ((file ? fstat(file.Get(), &status) : lstat(path.c_str(), &status)) != 0) {
        throw ErrnoFailure(path, "looked at");
    }
    if (Defect(status).empty() || !LosesNothing(status)) {
        throw Failure(ExitStatus::kCannotSave, path + " has been replaced meanwhile, and stays");
    }
    if (file && flock(file.Get(), LOCK_EX | LOCK_NB) != 0) {
        throw Failure(ExitStatus::kBusy, path + " is held by another program, and stays");
    }
    if (unlink(path.c_str()) != 0) {
        throw ErrnoFailure(path, "removed");
    }
}

void ReportMissing(const std::string &path, Findings &findings) {
    findings.Add(kNote, "lock file not made yet", {path},
                 "the library makes it with mode 0644; then everybody may hold it", "install -m 600 /dev/null %",
                 {path, "makes it, with mode 0600", {kMade}, [path](Patience &, std::string &) { Make(path); }});
}

void ReportDefect(const std::string &path, const struct stat &status, const std::string &meanwhile,
                  Findings &findings) {
    const auto replace = [path](Patience &, std::string &) {
        Remove(path);
        Make(path);
    };
    findings.Add(kWrong, Defect(status), {path}, "the lock cannot be relied on, so " + meanwhile,
                 std::string(S_ISDIR(status.st_mode) ? "rm -r" : "rm") + " %; the next change makes it anew",
                 {path,
                  "removes this name if nobody holds the file, and makes a new one, with mode 0600",
                  {"- " + Defect(status), kMade},
                  LosesNothing(status) ? replace : Action()});
}

void CheckLock(const std::string &path, const std::string &meanwhile, Findings &findings) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0) {
        ReportMissing(path, findings);
        return;
    }
    if (Defect(status).empty()) {
        CheckOwnership(path, kMode, "everybody who may read it can hold it, and stop all changes",
                       Correcting(path, kMode), findings);
    } else {
        ReportDefect(path, status, meanwhile, findings);
    }
    CheckHolders(path, meanwhile + " meanwhile", "wait for that program, or end it", findings);
}

// Locks in a /tmp of our own keep nobody out, and nobody's locks keep us out.
void CheckDirectoryOfLocks(Findings &findings) {
    constexpr const char *kHosts = "/proc/1/root/tmp";
    if (faccessat(AT_FDCWD, kHosts, F_OK, AT_EACCESS) != 0) {
        if (errno == EACCES || errno == EPERM) {
            findings.AddNotAllowed("whether /tmp is everybody's, by " + std::string(kHosts));
        }
        return;
    }
    std::error_code error;
    if (!std::filesystem::equivalent("/tmp", kHosts, error)) {
        findings.Add(kWrong, "this program sees another /tmp than the machine's first process", {},
                     "the locks of other programs are not seen: two may change the configuration at once",
                     "run this outside; a service that changes the configuration must have PrivateTmp=no");
    }
}

}  // namespace

void CheckHolders(const std::string &path, const std::string &why, const std::string &remedy, Findings &findings) {
    const auto holders = LastingLockHolders(path);
    if (!holders.empty()) {
        findings.Add(kWrong, path + " is held by " + holders, {}, why, remedy);
    }
}

void CheckLocks(Facts &facts, Findings &findings) {
    CheckDirectoryOfLocks(findings);
    CheckLock(VORK::FILEINDEX::Folders().GetLockPath(), "no folder can be added, changed or removed", findings);
    CheckLock(facts.status.GetLockPath(), "indexing can be neither paused nor resumed", findings);
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
