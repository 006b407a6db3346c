/// \file
/// From a path to the mount that holds it, without touching servers that may be dead.
#pragma once

#include "base/mount_table.h"

#include <optional>
#include <string>

namespace VORK::PLATFORM {

struct PathMount {
    std::string path;  ///< canonical: absolute, links followed, except below a network mount
    Mount mount;
    bool isRemote = false;  ///< then nothing below the mount has been looked at, nor that the path exists
    bool isMountPoint = false;
};

/// Nothing, with errno set, when the path does not exist or cannot be told. Does not trigger automounts.
std::optional<PathMount> FindMount(const std::string &path);

}  // namespace VORK::PLATFORM
