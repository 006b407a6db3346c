/// \file
/// What a batch of additions or removals has changed and others must hear of.
#pragma once

#include "records.h"

#include <fileindex/paths.h>

#include <json/value.h>

#include <syslog.h>

#include <set>
#include <string>

namespace VORK::FILEINDEX::internal {

/// Both are told in byte order. A path given twice keeps its later report.
struct Changes {
    Json::Value reports{Json::objectValue};  ///< share path -> what its event carries
    std::set<std::string> shares;

    /// False, with the record, for a path that names no share.
    bool Add(const std::string &path, const Json::Value &report, const Record &failure) {
        reports[path] = report;
        std::string share;
        if (!GetShareNameByPath(share, path)) {
            syslog(LOG_ERR, "%s:%d GetShareNameByPath failed, path=%s", failure.module, failure.line,
                   path.c_str());
            return false;
        }
        shares.insert(share);
        return true;
    }
};

}  // namespace VORK::FILEINDEX::internal
