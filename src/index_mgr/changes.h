/// \file
/// What a batch of additions or removals has changed and others must hear of.
#pragma once

#include <json/value.h>

#include <set>
#include <string>

namespace VORK::FILEINDEX::internal {

/// Both are told in byte order. A path given twice keeps its later report.
struct Changes {
    Json::Value reports{Json::objectValue};  ///< share path -> what its event carries
    std::set<std::string> shares;
};

}  // namespace VORK::FILEINDEX::internal
