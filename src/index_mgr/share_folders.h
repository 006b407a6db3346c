/// \file
/// The folders of one share, for the operations that change or clean shares.
#pragma once

#include <fileindex/folders.h>
#include <fileindex/paths.h>

#include <new>
#include <string>
#include <vector>

namespace VORK::FILEINDEX::internal {

/// As Folders::List by share, but an empty name means the records whose own share name is empty, never all. Throws
/// when memory runs out: a list that is too short would have a share cleaned that is in use.
inline std::vector<Folder> FoldersOf(Folders &store, const std::string &share) {
    std::vector<Folder> folders;
    if (!store.List(folders, share)) {
        throw std::bad_alloc();
    }
    if (share.empty()) {
        std::erase_if(folders, [](const Folder &folder) {
            std::string owner;
            return !GetShareNameByPath(owner, folder.path) || !owner.empty();
        });
    }
    return folders;
}

}  // namespace VORK::FILEINDEX::internal
