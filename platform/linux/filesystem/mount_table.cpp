#include "filesystem/mount_table.h"

#include "common/document.h"

#include <algorithm>
#include <sstream>

namespace VORK::PLATFORM {

namespace {

bool IsOctal(char c) {
    return c >= '0' && c <= '7';
}

// The kernel writes blanks, tabs, newlines and backslashes as three octal digits.
std::string Unescape(std::string_view text) {
    std::string plain;
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '\\' && i + 3 < text.size() && IsOctal(text[i + 1]) && IsOctal(text[i + 2]) &&
            IsOctal(text[i + 3])) {
            plain += static_cast<char>((text[i + 1] - '0') * 64 + (text[i + 2] - '0') * 8 + (text[i + 3] - '0'));
            i += 3;
        } else {
            plain += text[i];
        }
    }
    return plain;
}

// "36 35 98:0 /root /point rw,noatime master:1 - ext3 /dev/sda1 rw,errors=continue"
std::optional<Mount> ParseLine(const std::string &line) {
    std::istringstream fields(line);
    Mount mount;
    fields >> mount.id >> mount.parentId >> mount.device >> mount.root >> mount.point >> mount.options;
    std::string optional;
    while (fields >> optional && optional != "-") {
    }
    if (!(fields >> mount.type)) {
        return std::nullopt;
    }
    // An empty source leaves two blanks in a row, which the stream would take for one.
    std::string rest;
    std::getline(fields.ignore(1), rest);
    const size_t end = rest.find(' ');
    mount.source = Unescape(rest.substr(0, end));
    mount.superOptions = end == rest.npos ? "" : rest.substr(end + 1);
    mount.root = Unescape(mount.root);
    mount.point = Unescape(mount.point);
    mount.type = Unescape(mount.type);
    return mount;
}

}  // namespace

std::optional<MountTable> MountTable::Read() {
    const std::optional<std::string> text = ReadFile("/proc/self/mountinfo");
    if (!text) {
        return std::nullopt;
    }
    MountTable table;
    std::istringstream lines(*text);
    for (std::string line; std::getline(lines, line);) {
        if (std::optional<Mount> mount = ParseLine(line)) {
            table.mounts_.push_back(std::move(*mount));
        }
    }
    return table;
}

const Mount *MountTable::WithId(uint64_t id) const {
    const auto found =
        std::find_if(mounts_.begin(), mounts_.end(), [id](const Mount &mount) { return mount.id == id; });
    return found == mounts_.end() ? nullptr : &*found;
}

// The lowest mount on "/": the one whose parent is not in the table (or is itself, for the first of all).
const Mount *MountTable::Root() const {
    const auto found = std::find_if(mounts_.begin(), mounts_.end(), [this](const Mount &mount) {
        return mount.point == "/" && (mount.id == mount.parentId || WithId(mount.parentId) == nullptr);
    });
    return found == mounts_.end() ? nullptr : TopmostOn(&*found, "/");
}

// Follows the mounts stacked on one place. A mount covered by one further up is not reached, as for the kernel.
const Mount *MountTable::TopmostOn(const Mount *below, std::string_view point) const {
    for (;;) {
        const auto next = std::find_if(mounts_.begin(), mounts_.end(), [below, point](const Mount &mount) {
            return mount.parentId == below->id && mount.id != below->id && mount.point == point;
        });
        if (next == mounts_.end()) {
            return below;
        }
        below = &*next;
    }
}

const Mount *MountTable::Holding(std::string_view canonicalPath) const {
    const Mount *mount = Root();
    for (size_t end = 0; mount != nullptr && end < canonicalPath.size();) {
        end = std::min(canonicalPath.find('/', end + 1), canonicalPath.size());
        if (end > 1) {
            mount = TopmostOn(mount, canonicalPath.substr(0, end));
        }
    }
    return mount;
}

bool HasOption(std::string_view options, std::string_view option) {
    while (!options.empty()) {
        const size_t end = std::min(options.find(','), options.size());
        if (options.substr(0, end) == option) {
            return true;
        }
        options.remove_prefix(std::min(end + 1, options.size()));
    }
    return false;
}

}  // namespace VORK::PLATFORM
