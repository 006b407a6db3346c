#include "filesystem/loop_device.h"

#include "base/whole_file.h"

#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <optional>

namespace VORK::PLATFORM {

namespace {

constexpr std::string_view kLoopSource = "/dev/loop";
constexpr std::string_view kDeleted = " (deleted)";

// Some file systems, btrfs for one, are mounted under a device number of their own.
std::string BlockDeviceOf(const Mount &mount) {
    struct stat status {};
    if (mount.device.rfind("0:", 0) != 0) {
        return mount.device;
    }
    if (mount.source.rfind(kLoopSource, 0) != 0 || stat(mount.source.c_str(), &status) != 0 ||
        !S_ISBLK(status.st_mode)) {
        return "";
    }
    return std::to_string(major(status.st_rdev)) + ":" + std::to_string(minor(status.st_rdev));
}

std::string WithoutSuffix(std::string text, std::string_view suffix) {
    if (text.size() >= suffix.size() && text.compare(text.size() - suffix.size(), suffix.size(), suffix) == 0) {
        text.erase(text.size() - suffix.size());
    }
    return text;
}

}  // namespace

std::string BackingFileOf(const Mount &mount) {
    const std::string device = BlockDeviceOf(mount);
    if (device.empty()) {
        return "";
    }
    for (const char *attribute : {"/loop/backing_file", "/../loop/backing_file"}) {
        if (const std::optional<std::string> text = ReadFile("/sys/dev/block/" + device + attribute)) {
            return WithoutSuffix(WithoutSuffix(*text, "\n"), kDeleted);
        }
    }
    return "";
}

}  // namespace VORK::PLATFORM
