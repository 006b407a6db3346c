/// \file
/// The services that follow the folder list: the daemon, and the file-sharing service's search setting.
#pragma once

#include "records.h"

namespace VORK::FILEINDEX::internal {

// `failure` is the record of the operation that asks: each has its own for the same step.

bool StartDaemon(const Record &failure);
bool StopDaemon(const Record &failure);
bool StopDaemonAfterUpgrade();

/// Stores the setting; nothing takes effect before the service is restarted.
bool SetSearch(bool on, const Record &failure);

/// Where the setting differs from `on`, stores it and then restarts the service. Failures are recorded and
/// otherwise ignored: the index is right without it.
void EnsureSearch(bool on, const Record &setFailure, const Record &restartFailure);

}  // namespace VORK::FILEINDEX::internal
