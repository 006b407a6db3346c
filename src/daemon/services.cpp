#include "daemon/services.h"

#include "names.h"

#include <vork/error.h>
#include <vork/search.h>
#include <vork/service.h>

#include <syslog.h>

namespace VORK::FILEINDEX::internal {

namespace {

constexpr int kServiceFlag = 1;  // the platform's

/// The platform's last error, read in one order everywhere.
struct PlatformError {
    int code = VLIBCErrGet();
    const char *file = VLIBCErrorGetFile();
    int line = VLIBCErrorGetLine();
};

bool RestartFileSharing(const Record &failure) {
    if (VLIBServiceRestart(kFileSharingService) < 0) {
        const PlatformError error;
        syslog(LOG_ERR, "%s:%d VLIBServiceRestart failed: err=[0x%04X %s:%d]", failure.module, failure.line,
               error.code, error.file, error.line);
        return false;
    }
    return true;
}

}  // namespace

bool StartDaemon(const Record &failure) {
    if (VLIBServiceStart(kDaemonService, kServiceFlag) < 0) {
        const PlatformError error;
        syslog(LOG_ERR, "%s:%d VLIBServiceStart failed: err=[0x%04X %s:%d]", failure.module, failure.line,
               error.code, error.file, error.line);
        return false;
    }
    return true;
}

bool StopDaemon(const Record &failure) {
    if (VLIBServiceStop(kDaemonService, kServiceFlag) < 0) {
        const PlatformError error;
        syslog(LOG_ERR, "%s:%d VLIBServiceStop failed: err=[0x%04X %s:%d]", failure.module, failure.line,
               error.code, error.file, error.line);
        return false;
    }
    return true;
}

bool StopDaemonAfterUpgrade() {
    if (VLIBServiceStop(kDaemonService, kServiceFlag) < 0) {
        const PlatformError error;
        const Record &failure = records::kUpgradeStop;
        // The words name the start although the stop failed; support tools know the record by them.
        syslog(LOG_ERR, "%s:%d VLIBServiceStart failed: err=[0x%04X %s:%d]", failure.module, failure.line,
               error.code, error.file, error.line);
        return false;
    }
    return true;
}

bool SetSearch(bool on, const Record &failure) {
    if (VORKSMBSetSpotlight(on ? 1 : 0) < 0) {
        const PlatformError error;
        syslog(LOG_ERR, "%s:%d VORKSMBSetSpotlight failed: err=[0x%04X %s:%d]", failure.module, failure.line,
               error.code, error.file, error.line);
        return false;
    }
    return true;
}

void EnsureSearch(bool on, const Record &setFailure, const Record &restartFailure) {
    const bool isOn = VORKSMBIsEnableSpotlight() != 0;
    if (isOn == on) {
        return;
    }
    if (SetSearch(on, setFailure)) {
        (void)RestartFileSharing(restartFailure);
    }
}

}  // namespace VORK::FILEINDEX::internal
