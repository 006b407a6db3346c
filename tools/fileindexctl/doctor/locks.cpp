// The two lock files: can everybody take them who should, and does somebody keep one?
#include "../file_locks.h"
#include "../status_file.h"
#include "finding.h"
#include "ownership.h"

#include <fileindex/folders.h>

#include <sys/stat.h>

#include <fstream>

namespace fileindexctl::doctor {

namespace {

// In /tmp the kernel may refuse even root to open what somebody else has made.
std::string WhyOwnership() {
    int protection = 0;
    std::ifstream("/proc/sys/fs/protected_regular") >> protection;
    const std::string why = "everybody who may write to it can keep the configuration locked";
    return protection == 0
               ? why
               : why + "; and one that is not root's cannot be opened by root (fs.protected_regular is " +
                     std::to_string(protection) + ")";
}

Findings CheckLock(const std::string &path, const std::string &meanwhile) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0) {
        return {};  // made by the first change
    }
    if (!S_ISREG(status.st_mode)) {
        return {{path + " is not a regular file", "the lock cannot be taken, so " + meanwhile,
                 "rm -r " + path + "; the next change makes it anew"}};
    }
    Findings findings = CheckOwnership(path, WhyOwnership());
    const auto holders = LastingLockHolders(path);
    if (!holders.empty()) {
        findings.push_back({path + " is held by " + HolderText(holders), meanwhile + " meanwhile",
                            "wait for that program, or end it"});
    }
    return findings;
}

}  // namespace

Findings CheckLocks(const Facts & /*facts*/) {
    Findings findings =
        CheckLock(VORK::FILEINDEX::Folders().GetLockPath(), "no folder can be added, changed or removed");
    for (const auto &finding :
         CheckLock(StatusFile().GetLockPath(), "indexing can be neither paused nor resumed")) {
        findings.push_back(finding);
    }
    return findings;
}

}  // namespace fileindexctl::doctor
