/// \file
/// Mounts for reports: the facts behind the platform's answers, which are codes only.
#pragma once

#include "base/mount_table.h"

#include <optional>
#include <string>

namespace VORK::FILEINDEXCTL {

/// The mount that holds the path, links followed. Asks the file system, so it is not for paths on a network mount:
/// a dead server would never answer.
std::optional<Mount> MountOf(const std::string &path);

/// The mount that the path as it is spelt leads into. Asks nobody; links in the path are not seen.
std::optional<Mount> MountAbove(const std::string &path);

/// "ext4 (/dev/sda1), mounted on /vol1".
std::string MountText(const Mount &mount);

}  // namespace VORK::FILEINDEXCTL
