// Whether index data can be written in a share.
#include "common/failure.h"
#include "filesystem/btrfs.h"
#include "filesystem/path_mount.h"
#include "filesystem/types.h"

#include <vork/error.h>
#include <vork/share.h>

#include <cerrno>
#include <exception>
#include <optional>

using namespace VORK;
using namespace VORK::PLATFORM;

int VLIBShareIsReadOnlyGet(const struct _tag_VORKSHARE *pShare, int *pReadOnly) try {
    if (pShare == nullptr || pShare->szPath == nullptr || pReadOnly == nullptr) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const std::optional<PathMount> found = FindMount(pShare->szPath);
    if (!found) {
        return FailErrno(errno);
    }
    bool isReadOnly = HasOption(found->mount.options, "ro") || HasOption(found->mount.superOptions, "ro");
    if (!isReadOnly && CodeOfType(found->mount.type) == kBtrfs) {
        // The flag of the subvolume shows in no mount option.
        const std::optional<Subvolume> subvolume = SubvolumeOf(found->path);
        if (!subvolume) {
            return FailErrno(errno);
        }
        isReadOnly = subvolume->isReadOnly;
    }
    *pReadOnly = isReadOnly ? 1 : 0;
    return 0;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}
