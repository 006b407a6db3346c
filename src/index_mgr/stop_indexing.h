/// \file
/// What happens when the last indexed folder of the whole system is gone.
#pragma once

#include <fileindex/folders.h>

namespace VORK::FILEINDEX::internal {

/// The lines of the records of one operation.
struct StopIndexingLines {
    int stop;
    int setSearch;
    int restart;
};

bool IsEmpty(const Folders &store);

/// Stops the daemon and switches the search setting off; failures are recorded and change nothing else.
void StopIndexing(const StopIndexingLines &lines);

}  // namespace VORK::FILEINDEX::internal
