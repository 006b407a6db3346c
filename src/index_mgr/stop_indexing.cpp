#include "index_mgr/stop_indexing.h"

#include "daemon/services.h"
#include "folders/folder_access.h"

namespace VORK::FILEINDEX::internal {

bool IsEmpty(const Folders &store) {
    return FolderAccess::All(store).empty();
}

void StopIndexing(const StopRecords &failures) {
    (void)StopDaemon(failures.stop);
    EnsureSearch(false, failures.setSearch, failures.restart);
}

}  // namespace VORK::FILEINDEX::internal
