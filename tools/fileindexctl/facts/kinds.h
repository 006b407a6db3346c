/// \file
/// Which of the four kinds a file is of, by the extension of its name.
#pragma once

#include <json/value.h>

#include <string>

namespace VORK::FILEINDEXCTL {

inline constexpr const char *kOtherKind = "other";

/// "document", "audio", "video" or "photo"; kOtherKind for a file that is of none of them.
std::string KindOf(const std::string &path);

/// Why the kind of what is at the full path keeps it out of a folder with that record; empty when it does not.
/// `kind` stays empty for what is no file. A file of kOtherKind is known by its name, when any kind is on.
std::string ObstacleOfKind(const std::string &path, const Json::Value &record, std::string &kind);

}  // namespace VORK::FILEINDEXCTL
