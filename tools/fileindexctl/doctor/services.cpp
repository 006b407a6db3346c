// The programs on the other side: the daemon, the services, the search setting. While no folder is indexed, none
// of them has to be there.
#include "doctor/finding.h"
#include "doctor/repairs.h"
#include "facts/daemon.h"
#include "facts/patience.h"
#include "facts/platform_file.h"
#include "facts/system_services.h"
#include "report/failure.h"

#include <vork/process.h>
#include <vork/search.h>
#include <vork/service.h>

#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

constexpr const char *kDaemon = "fileindexd";
constexpr const char *kFileSharing = "samba";  // the platform's name for it
constexpr std::chrono::seconds kLongestStart(3);

// Without systemd it cannot be told.
bool IsLeftOutAtBoot(const std::string &name) {
    return RunsSystemd() && !Systemctl("is-enabled", name);
}

std::string StartCommand(const std::string &name) {
    return RunsSystemd() ? "systemctl start " + name : "service " + name + " start";
}

bool IsDaemonThere() {
    const DaemonCondition condition = ProbeDaemon().condition;
    return condition != DaemonCondition::kAbsent && condition != DaemonCondition::kStale;
}

// The service may report success before the daemon listens, or while it fails.
std::string Start(Patience & /*patience*/) {
    if (VLIBServiceStart(kDaemon, 1) < 0) {
        throw Failure(ExitStatus::kUnreachable, std::string(kDaemon) + " could not be started");
    }
    Patience patience(kLongestStart);
    while (!IsDaemonThere()) {
        if (!patience.Again()) {
            throw Failure(ExitStatus::kUnreachable,
                          std::string(kDaemon) +
                              " was started, but does not listen; the system log may tell "
                              "why");
        }
    }
    return {};
}

Finding Standstill(const std::string &what) {
    Finding finding{what, "folders are indexed, but nobody does it, and commands are lost", StartCommand(kDaemon)};
    if (IsServiceKnown(kDaemon)) {
        finding.repairs = {
            {kDaemon, "starts it", {"- not running", "+ running, also after the next boot"}, Start}};
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

std::string SwitchSearchOn(Patience & /*patience*/) {
    std::string copy = KeepCopy(kPlatformFile);
    if (VORKSMBSetSpotlight(1) < 0) {
        throw Failure(ExitStatus::kCannotSave, "the search setting could not be changed");
    }
    if (VLIBServiceRestart(kFileSharing) < 0) {
        throw Failure(ExitStatus::kUnreachable,
                      "search is on, but the file-sharing service could not be restarted");
    }
    return copy;
}

// Nothing is lost yet.
Findings CheckIdleDaemon() {
    const DaemonCondition condition = ProbeDaemon().condition;
    if (condition != DaemonCondition::kAbsent && condition != DaemonCondition::kStale) {
        return {};
    }
    return {{"fileindexd does not run",
             "no folder is indexed, so nothing is missed",
             IsServiceKnown(kDaemon) ? "the first folder that is added starts it"
                                     : "install the daemon's package before the first folder is added",
             {},
             Level::kNote}};
}

}  // namespace

Findings CheckDaemon(const Facts &facts) {
    if (facts.folders.empty()) {
        return CheckIdleDaemon();
    }
    const std::string socket = kDaemonSocket;
    const DaemonState state = ProbeDaemon();
    switch (state.condition) {
        case DaemonCondition::kListening:
            return {};
        case DaemonCondition::kAbsent:
            return {Standstill("fileindexd does not run: there is no " + socket)};
        case DaemonCondition::kStale:
            return {Standstill("fileindexd does not run: nobody listens on " + socket + ", which is left over")};
        case DaemonCondition::kFull:
            return {{"fileindexd accepts no connections on " + socket,
                     "it hangs: commands wait, and fail in the end",
                     "restart fileindexd; the system log may tell what it waits for"}};
        case DaemonCondition::kDenied:
            return state.listens.value_or(false) ? Findings() : Findings{NotAllowed("whether fileindexd listens")};
        case DaemonCondition::kUnknown:
            break;
    }
    return {{"whether fileindexd listens cannot be told: " + state.text,
             "commands may not reach it",
             "see the system log",
             {},
             Level::kUnexamined}};
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
    if (!IsFileSharingThere()) {
        findings.push_back({"this machine has no file-sharing service (smbd or smb)",
                            "the search setting is without effect, which indexing does not need",
                            "install the package of Samba if clients are to search",
                            {},
                            Level::kNote});
    }
    return findings;
}

Findings CheckSearch(const Facts &facts) {
    if (facts.folders.empty() || VORKSMBIsEnableSpotlight() != 0 || !IsFileSharingThere()) {
        return {};
    }
    if (!IsPlatformReadable()) {
        return {{"the search setting is not known",
                 std::string(kPlatformFile) + " cannot be read",
                 "mend what is found in the configuration",
                 {},
                 Level::kUnexamined}};
    }
    Finding finding{"the search setting is off", "folders are indexed, but clients cannot search them",
                    "switch it on in " + std::string(kPlatformFile) + ", and restart the file-sharing service"};
    finding.repairs = {{kPlatformFile,
                        "switches it on, and restarts the file-sharing service",
                        {"- \"search\": false", "+ \"search\": true"},
                        SwitchSearchOn}};
    return {finding};
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
