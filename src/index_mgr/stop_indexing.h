/// \file
/// What happens when the last indexed folder of the whole system is gone.
#pragma once

#include "records.h"

#include <fileindex/folders.h>

namespace VORK::FILEINDEX::internal {

/// The records of one operation.
struct StopRecords {
    Record stop;
    Record setSearch;
    Record restart;
};

bool IsEmpty(const Folders &store);

/// Stops the daemon and switches the search setting off; failures are recorded and change nothing else.
void StopIndexing(const StopRecords &failures);

}  // namespace VORK::FILEINDEX::internal
