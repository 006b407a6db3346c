/// \file
/// Which folder covers which path: the one rule of comparison, and the choice among several folders.
#pragma once

#include "folders/folder_access.h"

#include <fileindex/folder.h>

#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

/// Does `path` + "/" start with `folder` + "/"? So "/photo/2019" holds itself and "/photo/2019/x", not
/// "/photo/20190". Bytes are compared, nothing is normalised.
inline bool IsAtOrUnder(std::string_view path, std::string_view folder) {
    if (path.size() > folder.size() && path[folder.size()] != '/') {
        return false;  // settles most comparisons without looking at the folder's text
    }
    return path.starts_with(folder);
}

/// Does the folder cover the full path? One that could not be resolved covers none; compared by the rule above
/// its empty path would cover all.
inline bool Covers(const Folder &folder, std::string_view fullPath) {
    const std::string &stored = FolderAccess::StoredFullPath(folder);
    if (!stored.empty()) {
        return IsAtOrUnder(fullPath, stored);
    }
    const std::string place = folder.GetFullPath();
    return !place.empty() && IsAtOrUnder(fullPath, place);
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
