#include "ownership.h"

#include "../descriptor.h"
#include "../failure.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>

namespace fileindexctl::doctor {

namespace {

constexpr mode_t kMode = 0644;

std::string OwnershipText(uid_t owner, gid_t group, mode_t mode) {
    std::array<char, 64> text{};
    std::snprintf(text.data(), text.size(), "owner %u:%u, mode %04o", owner, group, mode & 07777U);
    return text.data();
}

// On the file that was opened, whatever stands under its name by now.
void Correct(const std::string &path) {
    const Descriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK));
    struct stat status {};
    if (!file || fstat(file.Get(), &status) != 0 || !S_ISREG(status.st_mode) || fchown(file.Get(), 0, 0) != 0 ||
        fchmod(file.Get(), kMode) != 0) {
        const bool denied = errno == EACCES || errno == EPERM || errno == EROFS;
        throw Failure(denied ? ExitStatus::Permission : ExitStatus::CannotSave,
                      path + " cannot be changed: " + std::strerror(errno));
    }
}

}  // namespace

Findings CheckOwnership(const std::string &path, const std::string &why) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) {
        return {};
    }
    const bool fits = status.st_uid == 0 && (status.st_mode & 07777U) == kMode;
    if (fits) {
        return {};
    }
    const std::string now = OwnershipText(status.st_uid, status.st_gid, status.st_mode);
    return {{path + " has " + now, why, "chown root:root " + path + "; chmod 0644 " + path,
             Repair{path, {"- " + now, "+ " + OwnershipText(0, 0, kMode)}, false, [path] { Correct(path); }}}};
}

}  // namespace fileindexctl::doctor
