/// \file
/// Opening directories in shares, whose users may put a link in the place of any of them at any moment.
#pragma once

#include "base/unique_fd.h"
#include "shares/share_table.h"

#include <string>

namespace VORK::PLATFORM {

/// A path taken apart at its last "/": the directory, "/" for one at the top, and the name in it.
struct DirectoryAndName {
    explicit DirectoryAndName(const std::string &path);

    std::string directory;
    std::string name;
};

/// Opens the directory (O_PATH) for system calls that take names in it. From the outermost share's directory that
/// holds it downwards no link is followed, and neither is one in the last place of a path outside the shares;
/// links above are the administrator's. Nothing, with errno set (ENOTDIR for a link), on failure.
UniqueFd OpenDirectory(const ShareTable &shares, const std::string &path);

}  // namespace VORK::PLATFORM
