#include "facts/file_locks.h"

#include "facts/mounts.h"
#include "report/text.h"

#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <sstream>
#include <thread>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr std::chrono::milliseconds kLookAgain{50};
constexpr int kLooks = 20;

std::string CommandOf(int process) {
    const std::string directory = "/proc/" + std::to_string(process);
    std::ifstream file(directory + "/cmdline", std::ios::binary);
    std::string command{std::istreambuf_iterator<char>(file), {}};
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

}  // namespace

std::vector<LockHolder> LockHolders(const std::string &path) {
    const std::string name = FileName(path);
    std::vector<LockHolder> holders;
    std::ifstream locks("/proc/locks");
    for (std::string line; !name.empty() && std::getline(locks, line);) {
        // "1: FLOCK  ADVISORY  WRITE 4711 00:2f:1234 0 EOF"; those that wait have "->" in the second place
        std::istringstream fields(line);
        std::string number;
        std::string kind;
        std::string advisory;
        std::string mode;
        int process = 0;
        std::string file;
        fields >> number >> kind >> advisory >> mode >> process >> file;
        if (kind == "FLOCK" && file == name) {
            holders.push_back({process, CommandOf(process)});
        }
    }
    return holders;
}

std::vector<LockHolder> LastingLockHolders(const std::string &path) {
    std::vector<LockHolder> lasting = LockHolders(path);
    for (int look = 1; look < kLooks && !lasting.empty(); ++look) {
        std::this_thread::sleep_for(kLookAgain);
        const auto now = LockHolders(path);
        std::erase_if(lasting, [&](const LockHolder &holder) {
            return std::find(now.begin(), now.end(), holder) == now.end();
        });
    }
    return lasting;
}

std::string HolderText(const std::vector<LockHolder> &holders) {
    std::vector<std::string> items;
    items.reserve(holders.size());
    for (const auto &holder : holders) {
        items.push_back("process " + std::to_string(holder.process) +
                        (holder.command.empty() ? "" : " (" + holder.command + ")"));
    }
    return Enumerate(items);
}

}  // namespace VORK::FILEINDEXCTL
