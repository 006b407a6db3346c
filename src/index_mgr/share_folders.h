/// \file
/// The folders of one share, for the operations that change or clean shares.
#pragma once

#include "folders/folder_access.h"

#include <string>
#include <vector>

namespace VORK::FILEINDEX::internal {

/// An empty name means the records whose own share name is empty, where Folders::List takes it for all.
inline std::vector<Folder> FoldersOf(const Folders &store, const std::string &share) {
    std::vector<Folder> folders;
    for (const auto &[path, folder] : FolderAccess::All(store)) {
        std::string owner;
        if (GetShareNameByPath(owner, folder.path) && owner == share) {
            folders.push_back(folder);
        }
    }
    return folders;
}

}  // namespace VORK::FILEINDEX::internal
