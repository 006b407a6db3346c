/// \file
/// The services that follow the folder list: the daemon, and the file-sharing service's search setting.
#pragma once

#include "records.h"

#include <vork/error.h>

namespace VORK::FILEINDEX::internal {

/// The platform's last error, read in one order everywhere.
struct PlatformError {
    int code = VLIBCErrGet();
    const char *file = VLIBCErrorGetFile();
    int line = VLIBCErrorGetLine();
};

// `failure`: each operation keeps a record of its own for the same step.

bool StartDaemon(const Record &failure);
bool StopDaemon(const Record &failure);

/// Stores the setting; nothing takes effect before the service is restarted.
bool SetSearch(bool on, const Record &failure);

/// Brings the setting to `on` and restarts the service, unless it is so already. A setting that cannot be
/// stored restarts nothing. Failures are recorded and otherwise ignored: the index is right without it.
void EnsureSearch(bool on, const Record &setFailure, const Record &restartFailure);

}  // namespace VORK::FILEINDEX::internal
