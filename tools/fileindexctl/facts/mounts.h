/// \file
/// What is mounted where, for reports: the facts behind the platform's answers, which are codes only.
#pragma once

#include <optional>
#include <string>

namespace VORK::FILEINDEXCTL {

struct Mount {
    unsigned long long id = 0;
    std::string device;  ///< "8:1", as /proc/locks has it too
    std::string point;
    std::string options;
    std::string type;
    std::string source;
};

/// The mount that holds the path, links followed. Asks the file system, so it is not for paths on a network mount:
/// a dead server would never answer.
std::optional<Mount> MountOf(const std::string &path);

/// The mount whose point is the longest start of the path. Asks nobody; links in the path are not seen.
std::optional<Mount> MountAbove(const std::string &path);

/// "ext4 (/dev/sda1), mounted on /vol1".
std::string MountText(const Mount &mount);

}  // namespace VORK::FILEINDEXCTL
