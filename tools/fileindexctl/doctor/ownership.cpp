// Owner and mode of files and directories.
#include "base/unique_fd.h"
#include "doctor/finding.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cstdio>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

std::string OctalText(mode_t mode) {
    std::array<char, 16> text{};
    std::snprintf(text.data(), text.size(), "%04o", mode & 07777U);
    return text.data();
}

std::string OwnershipText(const struct stat &status) {
    return "owner " + std::to_string(status.st_uid) + ":" + std::to_string(status.st_gid) + ", mode " +
           OctalText(status.st_mode);
}

bool MayBeMended(const struct stat &status) {
    return S_ISDIR(status.st_mode) || (S_ISREG(status.st_mode) && status.st_nlink == 1);
}

struct stat AfterMending(struct stat status, mode_t mode) {
    if (status.st_uid != 0) {
        status.st_uid = 0;
        status.st_gid = 0;
    }
    status.st_mode = mode != kNotForOthersToWrite ? mode : status.st_mode & 07755U;
    return status;
}

// On the file that was opened, whatever stands under its name by now.
void Correct(const std::string &path, mode_t mode) {
    const UniqueFd file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    struct stat status {};
    const bool opened = file && fstat(file.Get(), &status) == 0;
    if (opened && !MayBeMended(status)) {
        throw Failure(ExitStatus::kCannotSave, path + " has been replaced meanwhile, or has further names");
    }
    const struct stat after = AfterMending(status, mode);
    if (!opened || (status.st_uid != 0 && fchown(file.Get(), after.st_uid, after.st_gid) != 0) ||
        fchmod(file.Get(), after.st_mode) != 0) {
        throw ErrnoFailure(path, "changed");
    }
}

}  // namespace

Action Correcting(const std::string &path, mode_t mode) {
    return [path, mode](Patience &, std::string &) { Correct(path, mode); };
}

void CheckOwnership(const std::string &path, mode_t mode, const std::string &why, const Action &mend,
                    Findings &findings) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0 || (!S_ISREG(status.st_mode) && !S_ISDIR(status.st_mode))) {
        return;
    }
    const struct stat after = AfterMending(status, mode);
    const std::string is = OwnershipText(status);
    const std::string becomes = OwnershipText(after);
    if (is == becomes) {
        return;
    }
    if (!MayBeMended(status)) {
        return findings.Add(kWrong, is + ", and further names (hard links)", {path}, why,
                            "put a copy of % into its place, which is root's");
    }
    const std::string modeText = OctalText(after.st_mode);
    findings.Add(kWrong, is, {path}, why, "chown root %; chmod " + modeText + " %",
                 {path, "gives it to root, with mode " + modeText, {"- " + is, "+ " + becomes}, mend});
}

std::string ForeignText(const struct stat &status, const std::string &kind) {
    if (status.st_nlink > 1) {
        return kind + " that has further names (hard links)";
    }
    return status.st_uid == 0 ? "" : kind + " that user " + std::to_string(status.st_uid) + " owns";
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
