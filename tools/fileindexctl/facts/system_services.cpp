#include "facts/system_services.h"

#include <vork/process.h>

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>

namespace VORK::FILEINDEXCTL {

bool RunsSystemd() {
    struct stat status {};
    return stat("/run/systemd/system", &status) == 0 && S_ISDIR(status.st_mode);
}

bool Systemctl(const char *question, const std::string &name) {
    const std::string unit = name + ".service";
    const std::array<const char *, 5> arguments = {"systemctl", "--quiet", question, unit.c_str(), nullptr};
    return VLIBCExecv("/usr/bin/systemctl", arguments.data(), 1, 0) == 0;
}

bool IsServiceKnown(const std::string &name) {
    if (RunsSystemd()) {
        return Systemctl("cat", name);
    }
    return access(("/etc/init.d/" + name).c_str(), X_OK) == 0;
}

bool IsFileSharingThere() {
    constexpr std::array<const char *, 2> names = {"smbd", "smb"};
    return std::any_of(names.begin(), names.end(), IsServiceKnown);
}

}  // namespace VORK::FILEINDEXCTL
