#include "base/mount_table.h"

#include "base/whole_file.h"

#include <algorithm>
#include <charconv>

namespace VORK {

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

// No stream: making one takes a mutex of the C++ library where the host has set a locale, and a forked child may
// find that taken for good.
std::string_view TakeUntil(std::string_view &text, char end) {
    const size_t length = std::min(text.find(end), text.size());
    const std::string_view taken = text.substr(0, length);
    text.remove_prefix(std::min(length + 1, text.size()));
    return taken;
}

uint64_t TakeNumber(std::string_view &text) {
    const std::string_view digits = TakeUntil(text, ' ');
    uint64_t number = 0;
    std::from_chars(digits.data(), digits.data() + digits.size(), number);
    return number;
}

// "36 35 98:0 /root /point rw,noatime master:1 - ext3 /dev/sda1 rw,errors=continue"
std::optional<Mount> ParseLine(std::string_view line) {
    Mount mount;
    mount.id = TakeNumber(line);
    mount.parentId = TakeNumber(line);
    mount.device = TakeUntil(line, ' ');
    mount.root = Unescape(TakeUntil(line, ' '));
    mount.point = Unescape(TakeUntil(line, ' '));
    mount.options = TakeUntil(line, ' ');
    while (!line.empty() && TakeUntil(line, ' ') != "-") {
    }
    mount.type = Unescape(TakeUntil(line, ' '));
    if (mount.type.empty()) {
        return std::nullopt;
    }
    // An empty source leaves two blanks in a row.
    mount.source = Unescape(TakeUntil(line, ' '));
    mount.superOptions = line;
    return mount;
}

}  // namespace

std::optional<MountTable> MountTable::Read() {
    const std::optional<std::string> text = ReadFile("/proc/self/mountinfo");
    if (!text) {
        return std::nullopt;
    }
    MountTable table;
    for (std::string_view lines = *text; !lines.empty();) {
        if (std::optional<Mount> mount = ParseLine(TakeUntil(lines, '\n'))) {
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

}  // namespace VORK
