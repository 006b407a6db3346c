/// \file
/// What btrfs knows about its subvolumes.
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>

namespace VORK::PLATFORM {

struct Subvolume {
    uint64_t treeId = 0;
    std::array<uint8_t, 16> uuid{};
    bool isSnapshot = false;
    bool isReadOnly = false;

    bool IsSameAs(const Subvolume &other) const { return treeId == other.treeId && uuid == other.uuid; }
};

/// The subvolume that holds the path, which lies on btrfs. Nothing, with errno set, on failure. Needs no
/// privileges beyond reading the directory.
std::optional<Subvolume> SubvolumeOf(const std::string &path);

/// The least room that the quota groups of the subvolume, and the groups around them, leave; nothing when there
/// is no limit or it cannot be told. Needs CAP_SYS_ADMIN.
std::optional<uint64_t> RoomInQuotaGroups(const std::string &path);

}  // namespace VORK::PLATFORM
