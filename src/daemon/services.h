/// \file
/// The services that follow the folder list: the daemon, and the file-sharing service's search setting.
#pragma once

#include <vork/error.h>

namespace VORK::FILEINDEX::internal {

/// Where a failure is reported from: each operation keeps records of its own for the same step.
struct RecordAt {
    const char *module;
    int line;
};

/// The platform's last error, read in one order everywhere.
struct PlatformError {
    int code = VLIBCErrGet();
    const char *file = VLIBCErrorGetFile();
    int line = VLIBCErrorGetLine();
};

bool StartDaemon(const RecordAt &failure);
bool StopDaemon(const RecordAt &failure);

/// Stores the setting; nothing takes effect before the service is restarted.
bool SetSearch(bool on, const RecordAt &failure);

/// Brings the setting to `on` and restarts the service, unless it is so already. A setting that cannot be
/// stored restarts nothing. Failures are recorded and otherwise ignored: the index is right without it.
void EnsureSearch(bool on, const RecordAt &setFailure, const RecordAt &restartFailure);

}  // namespace VORK::FILEINDEX::internal
