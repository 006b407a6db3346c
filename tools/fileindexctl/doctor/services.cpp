// The programs on the other side: the daemon, the services, the search setting, the file-change monitor. While no
// folder is indexed, none of them has to be there.
#include "doctor/finding.h"
#include "facts/config_lock.h"
#include "facts/daemon.h"
#include "facts/platform_file.h"
#include "facts/queue_files.h"
#include "facts/registrations.h"
#include "facts/system_services.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>

#include <vork/search.h>
#include <vork/service.h>

#include <chrono>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

constexpr const char *kDaemon = "fileindexd";
constexpr const char *kFileSharing = "samba";  // the platform's name for it
constexpr std::chrono::seconds kLongestStart(3);

// The service may report success before the daemon listens, or while it fails.
void Start(Patience & /*patience*/, std::string & /*copy*/) {
    if (VLIBServiceStart(kDaemon, 1) < 0) {
        throw Failure(ExitStatus::kUnreachable, "fileindexd could not be started");
    }
    Patience patience(kLongestStart);
    while (!ProbeDaemon().listens.value_or(true)) {
        if (!patience.Again()) {
            throw Failure(ExitStatus::kUnreachable,
                          "fileindexd was started, but does not listen; the system log may tell why");
        }
    }
}

void ReportStandstill(const std::string &what, Findings &findings) {
    findings.Add(kWrong, "fileindexd does not run: " + what, {},
                 "folders are indexed, but nobody does it, and commands are lost",
                 RunsSystemd() ? "systemctl start fileindexd" : "service fileindexd start",
                 {kDaemon,
                  "starts it",
                  {"- not running", "+ running, also after the next boot"},
                  IsServiceKnown(kDaemon) ? Start : Action()});
}

void SwitchSearchOn(Patience & /*patience*/, std::string &copy) {
    copy = KeepCopy(kPlatformFile);
    if (VORKSMBSetSpotlight(1) < 0) {
        throw Failure(ExitStatus::kCannotSave, "the search setting could not be changed");
    }
    if (VLIBServiceRestart(kFileSharing) < 0) {
        throw Failure(ExitStatus::kUnreachable,
                      "search is on, but the file-sharing service could not be restarted");
    }
}

// Nothing is lost yet.
void CheckIdleDaemon(Findings &findings) {
    if (!ProbeDaemon().listens.value_or(true)) {
        findings.Add(kNote, "fileindexd does not run", {}, "no folder is indexed, so nothing is missed",
                     IsServiceKnown(kDaemon) ? "the first folder that is added starts it"
                                             : "install the daemon's package before the first folder is added");
    }
}

// Of all shares with folders: which of them were paused is lost with the file.
void RegisterAnew(Patience &patience, std::string &copy) {
    VORK::FILEINDEX::Folders store;
    ForgetErrors();
    const ConfigLock lock(store, patience);
    if (!lock.IsHeld()) {
        throw FailureOf(store);
    }
    try {
        ReadRegistrations();
        return;  // somebody else was faster
    } catch (const Failure &) {
        copy = SetAside(kRegistrationsFile);
    }
    std::vector<std::string> failed;
    for (const auto &share : SharesOf(ReadFolders())) {
        if (IsSharePresent(share) && !VORK::FILEINDEX::IndexMgr::UpsertVorkNotifydCfg(share)) {
            failed.push_back(share);
        }
    }
    if (!failed.empty()) {
        throw Failure(ExitStatus::kPartly,
                      "not registered: " + Enumerate(failed) + "; the former registrations are " + copy);
    }
}

void ReportBroken(const std::string &what, const Facts &facts, Findings &findings) {
    const Items shares(facts.indexedShares.begin(), facts.indexedShares.end());
    findings.Add(
        kWrong, what, {}, "no change is noticed, and \"add\", \"set\" and \"remove\" fail at the monitor",
        "put the file aside, then \"fileindexctl monitor refresh\"",
        {kRegistrationsFile,
         "puts the file aside and registers every share with indexed folders anew; those that were paused "
         "cannot be told from the others, and go on",
         {"- what cannot be read, registrations of other programs included",
          "+ registered: " + (shares.empty() ? "nothing" : Enumerate(shares))},
         RegisterAnew});
}

}  // namespace

void CheckDaemon(Facts &facts, Findings &findings) {
    if (facts.folders.empty()) {
        return CheckIdleDaemon(findings);
    }
    const std::string socket = kDaemonSocket;
    const DaemonState state = ProbeDaemon();
    switch (state.condition) {
        case DaemonCondition::kListening:
            return;
        case DaemonCondition::kAbsent:
            return ReportStandstill("there is no " + socket, findings);
        case DaemonCondition::kStale:
            return ReportStandstill("nobody listens on " + socket + ", which is left over", findings);
        case DaemonCondition::kFull:
            return findings.Add(kWrong, "fileindexd accepts no connections on " + socket, {},
                                "it hangs: commands wait, and fail in the end",
                                "restart fileindexd; the system log may tell what it waits for");
        case DaemonCondition::kDenied:
            if (!state.listens) {
                findings.AddNotAllowed("whether fileindexd listens");
            }
            return;
        case DaemonCondition::kUnknown:
            return findings.Add(kUnexamined, "whether fileindexd listens cannot be told: " + state.text, {},
                                "commands may not reach it", "see the system log");
    }
}

void CheckServices(Facts &facts, Findings &findings) {
    if (facts.folders.empty()) {
        return;
    }
    if (!IsServiceKnown(kDaemon)) {
        findings.Add(kWrong, "this machine has no service fileindexd", {},
                     "the daemon cannot be started and stopped as folders come and go",
                     "install the daemon's package");
    } else if (RunsSystemd() && !Systemctl("is-enabled", kDaemon)) {  // without systemd it cannot be told
        findings.Add(kWrong, "fileindexd is not started at boot", {}, "indexing stops with the next boot",
                     "systemctl enable fileindexd");
    }
    if (!IsFileSharingThere()) {
        findings.Add(kNote, "this machine has no file-sharing service (smbd or smb)", {},
                     "the search setting is without effect, which indexing does not need",
                     "install the package of Samba if clients are to search");
    }
}

void CheckSearch(Facts &facts, Findings &findings) {
    if (facts.folders.empty() || VORKSMBIsEnableSpotlight() != 0 || !IsFileSharingThere()) {
        return;
    }
    const std::string file = kPlatformFile;
    if (facts.platformFailure) {  // the setting reads as off
        return findings.Add(kUnexamined, "the search setting is not known", {}, file + " cannot be read",
                            "mend what is found in the configuration");
    }
    findings.Add(kWrong, "the search setting is off", {}, "folders are indexed, but clients cannot search them",
                 "switch it on in " + file + ", and restart the file-sharing service",
                 {file,
                  "switches it on, and restarts the file-sharing service",
                  {"- \"search\": false", "+ \"search\": true"},
                  SwitchSearchOn});
}

void CheckMonitor(Facts &facts, Findings &findings) try {
    const auto registrations = ReadRegistrations();
    for (const auto &share : facts.indexedShares) {
        const std::string queue = QueuePathOf(share);
        if (!queue.empty() && registrations.count(queue) == 0) {
            findings.Add(kNote, "paused share", {share}, "changes in it are not noticed",
                         "\"fileindexctl share resume %\" if it is to go on");
        }
    }
} catch (const Failure &failure) {
    if (failure.Status() == ExitStatus::kPermission) {
        findings.AddNotAllowed(failure.what());
    } else {
        ReportBroken(failure.what(), facts, findings);
    }
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
