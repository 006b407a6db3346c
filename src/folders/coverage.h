/// \file
/// Which folder covers which full path, and which of several governs it.
#pragma once

#include "base/path_cover.h"
#include "folders/folder_access.h"
#include "folders/places.h"

#include <fileindex/folder.h>

#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

/// Does the folder cover the full path? One without a full path of its own covers none: compared as text, an empty
/// path would cover all.
inline bool Covers(const Folder &folder, std::string_view fullPath) {
    const std::string &stored = FolderAccess::StoredFullPath(folder);
    if (!stored.empty()) {
        return IsAtOrUnder(fullPath, stored);
    }
    const std::string place = folder.GetFullPath();
    return !place.empty() && IsAtOrUnder(fullPath, place);
}

inline bool Covers(const FolderPlace &place, std::string_view fullPath) {
    if (place.volume != nullptr) {
        return fullPath.starts_with(*place.volume) &&
               IsAtOrUnder(fullPath.substr(place.volume->size()), place.path);
    }
    Folder unresolved;
    unresolved.path = place.path;
    return Covers(unresolved, fullPath);
}

/// Finds the folder that governs a full path. The last one considered wins, even over a nearer one before it:
/// the daemon chooses in the same way, and both must agree.
class Governing {
public:
    explicit Governing(std::string_view fullPath) : full_path_(fullPath) {}

    /// Keeps a pointer: `folder` has to outlive this object.
    void Consider(const Folder &folder) {
        if (Covers(folder, full_path_)) {
            folder_ = &folder;
        }
    }

    /// Null when none covers the path.
    const Folder *Get() const { return folder_; }

private:
    std::string_view full_path_;
    const Folder *folder_ = nullptr;
};

}  // namespace VORK::FILEINDEX::internal
