/// \file
/// Where the stored folders lie: all that most questions need to know of them.
#pragma once

#include <fileindex/folders.h>

#include <deque>
#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEX::internal {

struct FolderPlace {
    std::string_view path;
    const std::string *volume;  ///< what stands before it in the full path; null when that could not be found
};

/// As the records of a loaded store and found with the same questions to the platform, but without a copy of the
/// records: the places are views into the text of folder.conf.
class FolderPlaces {
public:
    /// As FolderAccess::Load.
    bool Load();

    /// In the order of the list.
    const std::vector<FolderPlace> &All() const { return places_; }

private:
    bool TakeText();

    std::string text_;
    std::string decoded_;
    Folders store_;  ///< holds the records of a folder.conf in unusual form
    std::deque<std::string> volumes_;
    std::vector<FolderPlace> places_;
};

}  // namespace VORK::FILEINDEX::internal
