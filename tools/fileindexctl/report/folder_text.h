/// \file
/// Folder records as people read and type them.
#pragma once

#include <json/value.h>

#include <string>

namespace VORK::FILEINDEXCTL {

/// The names of the four flags, as in folder.conf.
inline constexpr const char *kMediaKinds[] = {"document", "audio", "video", "photo"};

/// "document,photo", or "none": what --media takes.
std::string MediaText(const Json::Value &record);

/// Sets the four flags of the record from what --media was given. Throws Failure.
void SetMedia(Json::Value &record, const std::string &text);

/// The stored members of a record, without computed facts.
Json::Value FolderRecord(const Json::Value &record);

/// "processing", or "not indexable": from the facts "status" and "is_valid".
std::string StatusText(const Json::Value &facts);

}  // namespace VORK::FILEINDEXCTL
