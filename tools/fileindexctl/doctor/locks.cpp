// The two lock files: are they root's alone, so that nobody else can hold them, and does somebody keep one?
#include "base/unique_fd.h"
#include "doctor/finding.h"
#include "doctor/ownership.h"
#include "facts/file_locks.h"
#include "facts/status_file.h"
#include "report/failure.h"

#include <fileindex/folders.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

void Make(const std::string &path) {
    if (!UniqueFd(open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600))) {
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
    if (status.st_nlink > 1) {
        return "a lock file that has further names (hard links)";
    }
    return status.st_uid == 0 ? "" : "a lock file that user " + std::to_string(status.st_uid) + " owns";
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

Finding Missing(const std::string &path) {
    const auto act = [path](Patience &) {
        Make(path);
        return std::string();
    };
    return {"lock file not made yet",
            "the library makes it with mode 0644; then everybody may hold it",
            "install -m 600 /dev/null %",
            {{path, "makes it, with mode 0600", {"+ owner 0:0, mode 0600"}, act}},
            Level::kNote,
            {path}};
}

Finding Unusable(const std::string &path, const struct stat &status, const std::string &meanwhile) {
    Finding finding{
        Defect(status),
        "the lock cannot be relied on, so " + meanwhile,
        S_ISDIR(status.st_mode) ? "rm -r %; the next change makes it anew" : "rm %; the next change makes it anew",
        {},
        Level::kWrong,
        {path}};
    if (LosesNothing(status)) {
        const auto act = [path](Patience &) {
            Remove(path);
            Make(path);
            return std::string();
        };
        finding.repairs = {{path,
                            "removes this name if nobody holds the file, and makes a new one, with mode 0600",
                            {"- " + Defect(status), "+ owner 0:0, mode 0600"},
                            act}};
    }
    return finding;
}

Findings CheckLock(const std::string &path, const std::string &meanwhile) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0) {
        return {Missing(path)};
    }
    Findings findings =
        Defect(status).empty()
            ? CheckOwnership(path, kClosed, "everybody who may read it can hold it, and stop all changes")
            : Findings{Unusable(path, status, meanwhile)};
    const auto holders = LastingLockHolders(path);
    if (!holders.empty()) {
        findings.push_back({path + " is held by " + HolderText(holders), meanwhile + " meanwhile",
                            "wait for that program, or end it"});
    }
    return findings;
}

// Locks in a /tmp of our own keep nobody out, and nobody's locks keep us out.
Findings CheckDirectoryOfLocks() {
    constexpr const char *kHosts = "/proc/1/root/tmp";
    struct stat ours {};
    struct stat hosts {};
    if (stat(kHosts, &hosts) != 0) {
        return errno == EACCES || errno == EPERM
                   ? Findings{NotAllowed("whether /tmp is everybody's, by " + std::string(kHosts))}
                   : Findings();
    }
    if (stat("/tmp", &ours) == 0 && ours.st_dev == hosts.st_dev && ours.st_ino == hosts.st_ino) {
        return {};
    }
    return {{"this program sees another /tmp than the machine's first process",
             "the locks of other programs are not seen: two may change the configuration at once",
             "run this outside; a service that changes the configuration must have PrivateTmp=no"}};
}

}  // namespace

Findings CheckLocks(const Facts & /*facts*/) {
    Findings findings = CheckDirectoryOfLocks();
    Append(findings,
           CheckLock(VORK::FILEINDEX::Folders().GetLockPath(), "no folder can be added, changed or removed"));
    Append(findings, CheckLock(StatusFile().GetLockPath(), "indexing can be neither paused nor resumed"));
    return findings;
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
