// What the notification daemon was asked to watch.
#include "doctor/finding.h"
#include "doctor/repairs.h"
#include "facts/config_lock.h"
#include "facts/registrations.h"
#include "facts/share_record.h"
#include "report/failure.h"
#include "report/text.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

bool AreRegistrationsLegible() {
    try {
        ReadRegistrations();
        return true;
    } catch (const Failure &) {
        return false;
    }
}

// Of all shares with folders: which of them were paused is lost with the file.
std::string RegisterAnew(Patience &patience) {
    VORK::FILEINDEX::Folders store;
    ForgetErrors();
    const ConfigLock lock(store, patience);
    if (!lock.IsHeld()) {
        throw FailureOf(store);
    }
    if (AreRegistrationsLegible()) {  // somebody else was faster
        return {};
    }
    std::string former = SetAside(kRegistrationsFile);
    std::vector<std::string> failed;
    for (const auto &share : SharesOf(ReadFolders())) {
        if (IsSharePresent(share) && !VORK::FILEINDEX::IndexMgr::UpsertVorkNotifydCfg(share)) {
            failed.push_back(share);
        }
    }
    if (!failed.empty()) {
        throw Failure(ExitStatus::kPartly,
                      "not registered: " + Enumerate(failed) + "; the former registrations are " + former);
    }
    return former;
}

Finding Broken(const std::string &what, const Facts &facts) {
    std::vector<std::string> shares;
    for (const auto &[share, count] : facts.folderCount) {
        shares.push_back(share);
    }
    Finding finding{what, "no change is noticed, and \"add\", \"set\" and \"remove\" fail at the monitor",
                    "put the file aside, then \"fileindexctl monitor refresh\""};
    finding.repairs = {{kRegistrationsFile,
                        "puts the file aside and registers every share with indexed folders anew; those that were "
                        "paused cannot be told from the others, and go on",
                        {"- what cannot be read, registrations of other programs included",
                         "+ registered: " + (shares.empty() ? "nothing" : Enumerate(shares))},
                        RegisterAnew}};
    return finding;
}

}  // namespace

Findings CheckMonitor(const Facts &facts) {
    std::map<std::string, Watches> registrations;
    try {
        registrations = ReadRegistrations();
    } catch (const Failure &failure) {
        return {failure.Status() == ExitStatus::kPermission ? NotAllowed(failure.what())
                                                            : Broken(failure.what(), facts)};
    }
    Findings findings;
    for (const auto &[share, count] : facts.folderCount) {
        const SharePointer record = FindShare(share);
        if (record && registrations.count(QueueOf(*record)) == 0) {
            findings.push_back({"paused share",
                                "changes in it are not noticed",
                                "\"fileindexctl share resume %\" if it is to go on",
                                {},
                                Level::kNote,
                                {share}});
        }
    }
    return findings;
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
