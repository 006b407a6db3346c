// Mount points.
#include "common/failure.h"
#include "filesystem/path_mount.h"
#include "shares/share_source.h"

#include <vork/error.h>
#include <vork/filesystem.h>

#include <cerrno>
#include <exception>
#include <memory>
#include <optional>
#include <string_view>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace {

// A disk of its own for a share is nothing foreign in it. The path is compared as it is written, as everywhere.
bool IsDirectoryOfShare(std::string_view path) {
    while (path.size() > 1 && path.back() == '/') {
        path.remove_suffix(1);
    }
    const std::shared_ptr<const ShareTable> shares = Shares().Current().table;
    const Share *share = shares->Holding(path);
    return share != nullptr && share->path == path;
}

}  // namespace

int VORKFSDirIsMntPoint(const char *szPath) try {
    if (szPath == nullptr) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const std::optional<PathMount> found = FindMount(szPath);
    if (!found) {
        return FailErrno(errno);
    }
    return found->isMountPoint && !IsDirectoryOfShare(szPath) ? 1 : 0;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}
