#include "filesystem/btrfs.h"

#include "base/unique_fd.h"

#include <endian.h>
#include <fcntl.h>
#include <linux/btrfs.h>
#include <linux/btrfs_tree.h>
#include <sys/ioctl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstring>
#include <set>
#include <vector>

namespace VORK::PLATFORM {

namespace {

// The directory itself, or the one that holds the file: opening a device or a pipe could do anything.
UniqueFd OpenDirectoryOf(const std::string &path) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0) {
        return UniqueFd();
    }
    const std::string directory = S_ISDIR(status.st_mode) ? path : path.substr(0, path.rfind('/') + 1);
    return Open(directory.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
}

std::optional<Subvolume> SubvolumeAt(int fd) {
    btrfs_ioctl_get_subvol_info_args info{};
    // Newer kernels return 1 on success.
    if (ioctl(fd, BTRFS_IOC_GET_SUBVOL_INFO, &info) < 0) {
        return std::nullopt;
    }
    Subvolume subvolume;
    subvolume.treeId = info.treeid;
    std::copy(std::begin(info.uuid), std::end(info.uuid), subvolume.uuid.begin());
    subvolume.isSnapshot =
        std::any_of(std::begin(info.parent_uuid), std::end(info.parent_uuid), [](uint8_t b) { return b != 0; });
    subvolume.isReadOnly = (info.flags & BTRFS_ROOT_SUBVOL_RDONLY) != 0;
    return subvolume;
}

// The items of the quota tree with one object id and one type, as (offset, content).
struct Item {
    uint64_t offset;
    std::vector<char> content;
};

std::vector<Item> ItemsOf(const btrfs_ioctl_search_args &search) {
    std::vector<Item> items;
    size_t position = 0;
    for (uint32_t i = 0; i < search.key.nr_items; ++i) {
        btrfs_ioctl_search_header header{};
        std::memcpy(&header, search.buf + position, sizeof header);
        position += sizeof header;
        const char *content = search.buf + position;
        items.push_back({header.offset, std::vector<char>(content, content + header.len)});
        position += header.len;
    }
    return items;
}

// One call returns what fits into its buffer, some 4 KiB: plenty for the few items looked for here.
std::vector<Item> SearchQuotaTree(int fd, uint64_t objectId, uint32_t type, uint64_t from, uint64_t to) {
    btrfs_ioctl_search_args search{};
    search.key.tree_id = BTRFS_QUOTA_TREE_OBJECTID;
    search.key.min_objectid = search.key.max_objectid = objectId;
    search.key.min_type = search.key.max_type = type;
    search.key.min_offset = from;
    search.key.max_offset = to;
    search.key.max_transid = UINT64_MAX;
    search.key.nr_items = UINT32_MAX;
    if (ioctl(fd, BTRFS_IOC_TREE_SEARCH, &search) < 0) {
        return {};
    }
    return ItemsOf(search);
}

template <typename Content>
std::optional<Content> FindGroupItem(int fd, uint32_t type, uint64_t group) {
    const std::vector<Item> items = SearchQuotaTree(fd, 0, type, group, group);
    if (items.empty() || items.front().content.size() < sizeof(Content)) {
        return std::nullopt;
    }
    Content content{};
    std::memcpy(&content, items.front().content.data(), sizeof content);
    return content;
}

// Relations are stored in both directions; the group around another has the higher level, hence number.
std::set<uint64_t> GroupsAround(int fd, uint64_t group) {
    std::set<uint64_t> all{group};
    std::vector<uint64_t> left{group};
    while (!left.empty()) {
        const uint64_t inner = left.back();
        left.pop_back();
        for (const Item &outer : SearchQuotaTree(fd, inner, BTRFS_QGROUP_RELATION_KEY, inner + 1, UINT64_MAX)) {
            if (all.insert(outer.offset).second) {
                left.push_back(outer.offset);
            }
        }
    }
    return all;
}

uint64_t Left(uint64_t limit, uint64_t used) {
    return limit > used ? limit - used : 0;
}

std::optional<uint64_t> RoomInGroup(int fd, uint64_t group) {
    const auto limit = FindGroupItem<btrfs_qgroup_limit_item>(fd, BTRFS_QGROUP_LIMIT_KEY, group);
    const auto info = FindGroupItem<btrfs_qgroup_info_item>(fd, BTRFS_QGROUP_INFO_KEY, group);
    if (!limit || !info) {
        return std::nullopt;
    }
    const uint64_t flags = le64toh(limit->flags);
    uint64_t room = UINT64_MAX;
    if ((flags & BTRFS_QGROUP_LIMIT_MAX_RFER) != 0) {
        room = std::min(room, Left(le64toh(limit->max_rfer), le64toh(info->rfer)));
    }
    if ((flags & BTRFS_QGROUP_LIMIT_MAX_EXCL) != 0) {
        room = std::min(room, Left(le64toh(limit->max_excl), le64toh(info->excl)));
    }
    return room == UINT64_MAX ? std::nullopt : std::optional(room);
}

}  // namespace

std::optional<Subvolume> SubvolumeOf(const std::string &path) {
    const UniqueFd directory = OpenDirectoryOf(path);
    if (!directory) {
        return std::nullopt;
    }
    return SubvolumeAt(directory.Get());
}

std::optional<uint64_t> RoomInQuotaGroups(const std::string &path) {
    const UniqueFd directory = OpenDirectoryOf(path);
    const std::optional<Subvolume> subvolume = directory ? SubvolumeAt(directory.Get()) : std::nullopt;
    if (!subvolume) {
        return std::nullopt;
    }
    std::optional<uint64_t> least;
    for (const uint64_t group : GroupsAround(directory.Get(), subvolume->treeId)) {
        const std::optional<uint64_t> room = RoomInGroup(directory.Get(), group);
        if (room && (!least || *room < *least)) {
            least = room;
        }
    }
    return least;
}

}  // namespace VORK::PLATFORM
