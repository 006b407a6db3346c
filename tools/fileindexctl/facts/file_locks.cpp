#include "facts/file_locks.h"

#include "base/whole_file.h"
#include "facts/mounts.h"
#include "report/text.h"

#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdio>
#include <fstream>
#include <sstream>
#include <thread>
#include <vector>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr std::chrono::milliseconds kLookAgain{50};
constexpr int kLooks = 20;

std::string CommandOf(int process) {
    std::string command = ReadFile("/proc/" + std::to_string(process) + "/cmdline").value_or("");
    while (!command.empty() && command.back() == '\0') {
        command.pop_back();
    }
    std::replace(command.begin(), command.end(), '\0', ' ');
    return command;
}

// "00:2f:1234", as /proc/locks names files. Its device is that of the file system, which on btrfs is not what stat
// tells; the mount table has the right one.
std::string FileName(const std::string &path) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) {
        return {};
    }
    unsigned major = major(status.st_dev);
    unsigned minor = minor(status.st_dev);
    if (const auto mount = MountOf(path)) {
        std::sscanf(mount->device.c_str(), "%u:%u", &major, &minor);
    }
    std::array<char, 64> name{};
    std::snprintf(name.data(), name.size(), "%02x:%02x:%llu", major, minor,
                  static_cast<unsigned long long>(status.st_ino));
    return name.data();
}

std::string HolderText(int process) {
    const std::string command = CommandOf(process);
    return "process " + std::to_string(process) + (command.empty() ? "" : " (" + command + ")");
}

std::vector<std::string> HoldersNow(const std::string &path) {
    const std::string name = FileName(path);
    std::vector<std::string> holders;
    std::ifstream locks("/proc/locks");
    for (std::string line; !name.empty() && std::getline(locks, line);) {
        // "1: FLOCK  ADVISORY  WRITE 4711 00:2f:1234 0 EOF"; those that wait have "->" in the second place
        std::istringstream fields(line);
        std::string kind;
        std::string skipped;
        int process = 0;
        std::string file;
        fields >> skipped >> kind >> skipped >> skipped >> process >> file;
        if (kind == "FLOCK" && file == name) {
            holders.push_back(HolderText(process));
        }
    }
    return holders;
}

}  // namespace

std::string LastingLockHolders(const std::string &path) {
    std::vector<std::string> lasting = HoldersNow(path);
    for (int look = 1; look < kLooks && !lasting.empty(); ++look) {
        std::this_thread::sleep_for(kLookAgain);
        const auto now = HoldersNow(path);
        std::erase_if(lasting, [&](const std::string &holder) {
            return std::find(now.begin(), now.end(), holder) == now.end();
        });
    }
    return Enumerate(lasting);
}

}  // namespace VORK::FILEINDEXCTL
