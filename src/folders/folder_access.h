/// \file
/// What the library's own code may do with a Folder or the store beyond their interface.
#pragma once

#include <fileindex/folders.h>
#include <fileindex/paths.h>

#include <functional>
#include <map>
#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

struct FolderAccess {
    /// The full path as found when the path was set, without asking again; empty when it could not be resolved.
    static const std::string &StoredFullPath(const Folder &folder) { return folder.full_path_; }

    static const std::map<std::string, Folder> &All(const Folders &store) { return store.folders_; }

    /// As Folders::Load, without making the document: for a store that nobody but the library will look into.
    static bool Load(Folders &store);

    /// As Folders::Save, likewise.
    static bool Save(const Folders &store);

    /// Reads the store's file. What `takeUsual` does not take goes the exact way, through the document.
    static bool LoadWith(Folders &store, const std::function<bool(std::string &text)> &takeUsual);

    /// Fills the list from the text of a folder.conf in its usual form, without making the document. False, with
    /// nothing taken, when it is not quite that.
    static bool TakeText(Folders &store, std::string_view text);

    /// Fills the list from the document. Not an object: one record, FILEINDEX_ERR_MALFORMED_CONFIG, false.
    static bool TakeDocument(Folders &store);

    /// Stores one that is not stored yet; they come in the list's order.
    static void Add(Folders &store, std::string path, Folder folder);

    /// Looks for the full path again. The old one is forgotten first: none is better than that of another path.
    static bool Resolve(Folder &folder) {
        folder.full_path_.clear();
        return GetFullPath(folder.full_path_, folder.path);
    }
};

}  // namespace VORK::FILEINDEX::internal
