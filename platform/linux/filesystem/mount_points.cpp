// Mount points.
#include "common/failure.h"
#include "filesystem/path_mount.h"

#include <vork/error.h>
#include <vork/filesystem.h>

#include <cerrno>
#include <exception>
#include <optional>

using namespace VORK::PLATFORM;

int VORKFSDirIsMntPoint(const char *szPath) try {
    if (szPath == nullptr) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const std::optional<PathMount> found = FindMount(szPath);
    if (!found) {
        return FailErrno(errno);
    }
    return found->isMountPoint ? 1 : 0;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}
