/// \file
/// status.conf as a document: the library answers for one share at a time, reports and repairs need it whole.
#pragma once

#include <fileindex/status.h>

#include <json/value.h>

#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

class StatusFile : public VORK::FILEINDEX::Status {
public:
    Json::Value &Document() { return document_; }

    /// The shares that have the flag, indexed or not.
    std::vector<std::string> Marked(const char *flag) const {
        const bool usable = document_.isObject() && document_[flag].isObject();
        return usable ? document_[flag].getMemberNames() : std::vector<std::string>();
    }
};

}  // namespace VORK::FILEINDEXCTL
