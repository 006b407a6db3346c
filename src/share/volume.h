/// \file
/// Where a share's volume is mounted.
#pragma once

#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

/// The part of a share path's full path that stands before the share path. Records, errors and the one question to
/// the platform are those of GetFullPath.
bool GetVolume(std::string &volume, std::string_view sharePath);

}  // namespace VORK::FILEINDEX::internal
