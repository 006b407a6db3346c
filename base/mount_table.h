/// \file
/// The mounts of this process, from /proc/self/mountinfo.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace VORK {

struct Mount {
    uint64_t id = 0;
    uint64_t parentId = 0;
    std::string device;        ///< "major:minor"
    std::string root;          ///< the directory of the file system that is mounted
    std::string point;         ///< where
    std::string options;       ///< of the mount, comma-separated
    std::string type;          ///< as the kernel spells it, "fuse.sshfs"
    std::string source;        ///< a device, a server, a data set
    std::string superOptions;  ///< of the file system
};

class MountTable {
public:
    /// Reading touches no file system but /proc. Nothing, with errno set, on failure.
    static std::optional<MountTable> Read();

    const Mount *WithId(uint64_t id) const;

    /// The mount that a canonical path (no links, no "..") leads into, told from the table alone: a server that
    /// does not answer is not asked. Null for an empty table.
    const Mount *Holding(std::string_view canonicalPath) const;

private:
    const Mount *Root() const;
    const Mount *TopmostOn(const Mount *below, std::string_view point) const;

    std::vector<Mount> mounts_;
};

/// Whether the comma-separated options hold this one.
bool HasOption(std::string_view options, std::string_view option);

}  // namespace VORK
