/// \file
/// The configuration of the Linux platform: which shares it lists. The platform's interface looks shares up by
/// name only.
#pragma once

#include "base/platform_files.h"

#include <json/value.h>

#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

/// The document. Throws Failure when it is missing or malformed.
Json::Value ReadPlatformFile();

/// The members of the document that the platform ignores: "share", "shares.photo.pth". A misspelt one may stand
/// for any number of shares.
std::vector<std::string> UnknownMembers(const Json::Value &document);

/// The names of all shares, also of those that the platform refuses; none when the file cannot be read.
std::vector<std::string> ConfiguredShares();

}  // namespace VORK::FILEINDEXCTL
