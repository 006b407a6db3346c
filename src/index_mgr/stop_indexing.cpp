#include "index_mgr/stop_indexing.h"

#include "daemon/services.h"
#include "folders/folder_access.h"
#include "names.h"

namespace VORK::FILEINDEX::internal {

bool IsEmpty(const Folders &store) {
    return FolderAccess::All(store).empty();
}

void StopIndexing(const StopIndexingLines &lines) {
    (void)StopDaemon({kIndexMgrModule, lines.stop});
    EnsureSearch(false, {kIndexMgrModule, lines.setSearch}, {kIndexMgrModule, lines.restart});
}

}  // namespace VORK::FILEINDEX::internal
