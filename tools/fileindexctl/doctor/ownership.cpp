#include "doctor/ownership.h"

#include "base/unique_fd.h"
#include "report/failure.h"

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <cstdio>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

mode_t Mended(mode_t mode, Modes modes) {
    return ((mode | modes.required) & ~modes.forbidden) & 07777U;
}

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

struct stat AfterMending(struct stat status, Modes modes) {
    if (status.st_uid != 0) {
        status.st_uid = 0;
        status.st_gid = 0;
    }
    status.st_mode = Mended(status.st_mode, modes);
    return status;
}

// On the file that was opened, whatever stands under its name by now.
void Correct(const std::string &path, Modes modes) {
    const UniqueFd file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    struct stat status {};
    const bool opened = file && fstat(file.Get(), &status) == 0;
    if (opened && !MayBeMended(status)) {
        throw Failure(ExitStatus::kCannotSave, path + " has been replaced meanwhile, or has further names");
    }
    const struct stat after = AfterMending(status, modes);
    if (!opened || (status.st_uid != 0 && fchown(file.Get(), after.st_uid, after.st_gid) != 0) ||
        fchmod(file.Get(), after.st_mode) != 0) {
        throw ErrnoFailure(path, "changed");
    }
}

}  // namespace

Findings CheckOwnership(const std::string &path, Modes modes, const std::string &why) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0 || (!S_ISREG(status.st_mode) && !S_ISDIR(status.st_mode))) {
        return {};
    }
    const mode_t mended = Mended(status.st_mode, modes);
    if (status.st_uid == 0 && (status.st_mode & 07777U) == mended) {
        return {};
    }
    const std::string now = OwnershipText(status);
    if (!MayBeMended(status)) {
        return {{now + ", and further names (hard links)",
                 why,
                 "put a copy of % into its place, which is root's",
                 {},
                 Level::kWrong,
                 {path}}};
    }
    const auto act = [path, modes](Patience &) {
        Correct(path, modes);
        return std::string();
    };
    const std::string does = "gives it to root, with mode " + OctalText(mended);
    return {{now,
             why,
             "chown root %; chmod " + OctalText(mended) + " %",
             {{path, does, {"- " + now, "+ " + OwnershipText(AfterMending(status, modes))}, act}},
             Level::kWrong,
             {path}}};
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
