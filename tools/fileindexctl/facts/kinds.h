/// \file
/// Which of the four kinds a file is of, by the extension of its name.
#pragma once

#include <json/value.h>

#include <string>

namespace VORK::FILEINDEXCTL {

inline constexpr const char *kOtherKind = "other";

/// Why the kind of what is at the full path keeps it out of a folder with that record; empty when it does not.
/// `kind` becomes the file's, kOtherKind for one of none of the four, and stays empty for what is no file.
std::string ObstacleOfKind(const std::string &path, const Json::Value &record, std::string &kind);

}  // namespace VORK::FILEINDEXCTL
