#include "facts/mounts.h"

#include "facts/paths.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <fstream>
#include <sstream>
#include <vector>

namespace VORK::FILEINDEXCTL {

namespace {

// The kernel writes blanks, tabs, newlines and backslashes as a backslash and three octal digits.
std::string Unescape(const std::string &text) {
    std::string plain;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '\\' && i + 3 < text.size()) {
            plain += static_cast<char>(std::stoi(text.substr(i + 1, 3), nullptr, 8));
            i += 3;
        } else {
            plain += text[i];
        }
    }
    return plain;
}

// "36 35 98:0 /root /point rw,noatime master:1 - ext3 /dev/sda1 rw", of which the source may be empty.
std::optional<Mount> ParseMount(const std::string &line) {
    const auto dash = line.find(" - ");
    if (dash == std::string::npos) {
        return std::nullopt;
    }
    Mount mount;
    std::string skipped;
    std::istringstream left(line.substr(0, dash));
    left >> mount.id >> skipped >> mount.device >> skipped >> mount.point >> mount.options;
    std::istringstream right(line.substr(dash + 3));
    std::getline(right, mount.type, ' ');
    std::getline(right, mount.source, ' ');
    mount.point = Unescape(mount.point);
    mount.source = Unescape(mount.source);
    return mount;
}

std::vector<Mount> ReadMounts() {
    std::vector<Mount> mounts;
    std::ifstream file("/proc/self/mountinfo");
    for (std::string line; std::getline(file, line);) {
        if (auto mount = ParseMount(line)) {
            mounts.push_back(std::move(*mount));
        }
    }
    return mounts;
}

}  // namespace

std::optional<Mount> MountOf(const std::string &path) {
    struct statx status {};
    if (statx(AT_FDCWD, path.c_str(), AT_NO_AUTOMOUNT | AT_STATX_DONT_SYNC, STATX_MNT_ID, &status) != 0 ||
        (status.stx_mask & STATX_MNT_ID) == 0) {
        return std::nullopt;
    }
    for (auto &mount : ReadMounts()) {
        if (mount.id == status.stx_mnt_id) {
            return std::move(mount);
        }
    }
    return std::nullopt;
}

std::optional<Mount> MountAbove(const std::string &path) {
    std::optional<Mount> best;
    for (auto &mount : ReadMounts()) {
        const bool holds = mount.point == "/" || LiesIn(path, mount.point);
        // Of several mounts on one point, the last in the table is the topmost.
        if (holds && (!best || mount.point.size() >= best->point.size())) {
            best = std::move(mount);
        }
    }
    return best;
}

std::string MountText(const Mount &mount) {
    return mount.type + (mount.source.empty() ? "" : " (" + mount.source + ")") + ", mounted on " + mount.point;
}

}  // namespace VORK::FILEINDEXCTL
