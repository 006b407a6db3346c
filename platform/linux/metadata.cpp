// The hidden metadata directories.
#include "common/failure.h"

#include <vork/error.h>
#include <vork/metadata.h>

#include <sys/stat.h>

#include <cerrno>
#include <cstring>

using VORK::PLATFORM::Fail;
using VORK::PLATFORM::FailErrno;

namespace {

constexpr const char *kHiddenDirectory = "@eaDir";

// Services write here, as root; everybody else may read. Users of the share must not be able to plant files
// that a service then takes for its own.
constexpr mode_t kMode = 0755;

}  // namespace

int VORKEAIsHiddenDir(const char *szName) {
    return szName != nullptr && std::strcmp(szName, kHiddenDirectory) == 0 ? 1 : 0;
}

int VORKEAMKDir(int flags, const char *szPath) {
    if (flags != 0 || szPath == nullptr || szPath[0] != '/') {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    if (mkdir(szPath, kMode) == 0) {
        return 0;
    }
    if (errno != EEXIST) {
        return FailErrno(errno);
    }
    struct stat status {};
    if (lstat(szPath, &status) != 0) {
        return FailErrno(errno);
    }
    return S_ISDIR(status.st_mode) ? 0 : Fail(VORK_ERR_EXISTS);
}
