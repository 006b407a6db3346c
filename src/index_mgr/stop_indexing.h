/// \file
/// What happens when the last indexed folder of the whole system is gone.
#ifndef FILEINDEX_SRC_INDEX_MGR_STOP_INDEXING_H
#define FILEINDEX_SRC_INDEX_MGR_STOP_INDEXING_H

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

#endif
