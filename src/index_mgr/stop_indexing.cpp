#include "index_mgr/stop_indexing.h"

#include "names.h"
#include "utils/services.h"

#include <vector>

namespace VORK::FILEINDEX::internal {

bool IsEmpty(Folders &store) {
    std::vector<Folder> folders;
    return store.List(folders) && folders.empty();
}

void StopIndexing(const StopIndexingLines &lines) {
    (void)StopDaemon({kIndexMgrModule, lines.stop});
    EnsureSearch(false, {kIndexMgrModule, lines.setSearch}, {kIndexMgrModule, lines.restart});
}

}  // namespace VORK::FILEINDEX::internal
