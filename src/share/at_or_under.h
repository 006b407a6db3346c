/// \file
/// The one rule by which a path belongs to a folder.
#pragma once

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

}  // namespace VORK::FILEINDEX::internal
