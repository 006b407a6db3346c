// The programs on the other side: the daemon, the services, the search setting. While no folder is indexed, none
// of them has to be there.
#include "../daemon.h"
#include "../failure.h"
#include "../patience.h"
#include "../platform_file.h"
#include "finding.h"

#include <vork/process.h>
#include <vork/search.h>
#include <vork/service.h>

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>

namespace fileindexctl::doctor {

namespace {

constexpr const char *kDaemon = "fileindexd";
constexpr const char *kFileSharing = "samba";  // the platform's name for it
constexpr std::chrono::seconds kLongestStart(3);

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

// Without systemd it cannot be told.
bool IsLeftOutAtBoot(const std::string &name) {
    return RunsSystemd() && !Systemctl("is-enabled", name);
}

std::string StartCommand(const std::string &name) {
    return RunsSystemd() ? "systemctl start " + name : "service " + name + " start";
}

bool IsDaemonThere() {
    const DaemonCondition condition = ProbeDaemon().condition;
    return condition != DaemonCondition::Absent && condition != DaemonCondition::Stale;
}

// The service may report success before the daemon listens, or while it fails.
void Start() {
    if (VLIBServiceStart(kDaemon, 1) < 0) {
        throw Failure(ExitStatus::Unreachable, std::string(kDaemon) + " could not be started");
    }
    Patience patience(kLongestStart);
    while (!IsDaemonThere()) {
        if (!patience.Again()) {
            throw Failure(ExitStatus::Unreachable,
                          std::string(kDaemon) +
                              " was started, but does not listen; the system log may tell "
                              "why");
        }
    }
}

Finding Standstill(const std::string &what) {
    Finding finding{what, "folders are indexed, but nobody does it, and commands are lost", StartCommand(kDaemon)};
    if (IsServiceKnown(kDaemon)) {
        finding.repair = Repair{kDaemon, {"- not running", "+ running, also after the next boot"}, false, Start};
    }
    return finding;
}

// Otherwise the setting reads as off, and there is another finding.
bool IsPlatformReadable() {
    try {
        ReadPlatformFile();
        return true;
    } catch (const Failure &) {
        return false;
    }
}

void SwitchSearchOn() {
    if (VORKSMBSetSpotlight(1) < 0) {
        throw Failure(ExitStatus::CannotSave, "the search setting could not be changed");
    }
    if (VLIBServiceRestart(kFileSharing) < 0) {
        throw Failure(ExitStatus::Unreachable,
                      "search is on, but the file-sharing service could not be restarted");
    }
}

}  // namespace

Findings CheckDaemon(const Facts &facts) {
    if (facts.folders.empty()) {
        return {};
    }
    const std::string socket = kDaemonSocket;
    switch (ProbeDaemon().condition) {
        case DaemonCondition::Listening:
            return {};
        case DaemonCondition::Absent:
            return {Standstill("fileindexd does not run: there is no " + socket)};
        case DaemonCondition::Stale:
            return {Standstill("fileindexd does not run: nobody listens on " + socket + ", which is left over")};
        case DaemonCondition::Full:
            return {{"fileindexd accepts no connections on " + socket,
                     "it hangs: commands wait, and fail in the end",
                     "restart fileindexd; the system log may tell what it waits for"}};
        case DaemonCondition::Denied:
            return {{socket + " may not be written to by this user", "commands do not reach fileindexd",
                     "run this as the administrator"}};
        case DaemonCondition::Unknown:
            break;
    }
    return {{"whether fileindexd listens cannot be told: " + ProbeDaemon().text, "commands may not reach it",
             "see the system log"}};
}

Findings CheckServices(const Facts &facts) {
    if (facts.folders.empty()) {
        return {};
    }
    Findings findings;
    if (!IsServiceKnown(kDaemon)) {
        findings.push_back({"this machine has no service fileindexd",
                            "the daemon cannot be started and stopped as folders come and go",
                            "install the daemon's package"});
    } else if (IsLeftOutAtBoot(kDaemon)) {
        findings.push_back({"fileindexd is not started at boot", "indexing stops with the next boot",
                            "systemctl enable fileindexd"});
    }
    constexpr std::array<const char *, 2> names = {"smbd", "smb"};
    if (std::none_of(names.begin(), names.end(), IsServiceKnown)) {
        findings.push_back({"this machine has no file-sharing service (smbd or smb)",
                            "a change of the search setting does not take effect",
                            "install the package of Samba"});
    }
    return findings;
}

Findings CheckSearch(const Facts &facts) {
    if (facts.folders.empty() || VORKSMBIsEnableSpotlight() != 0 || !IsPlatformReadable()) {
        return {};
    }
    Finding finding{"the search setting is off", "folders are indexed, but clients cannot search them",
                    "switch it on in " + std::string(kPlatformFile) + ", and restart the file-sharing service"};
    finding.repair = Repair{kPlatformFile, {"- \"search\": false", "+ \"search\": true"}, true, SwitchSearchOn};
    return {finding};
}

}  // namespace fileindexctl::doctor
