/// \file
/// status.conf as a document: the library answers for one share at a time, reports and repairs need it whole.
#pragma once

#include <fileindex/status.h>

#include <json/value.h>

#include <set>
#include <string>

namespace VORK::FILEINDEXCTL {

class StatusFile : public VORK::FILEINDEX::Status {
public:
    Json::Value &Document() { return document_; }

    /// Loads the file, for the end of the pause in it. Throws Failure.
    long long LoadPause();

    /// The shares that have the flag, indexed or not.
    std::set<std::string> Marked(const char *flag) const;

    /// The steps that are marked as done.
    std::set<std::string> Markers();
};

}  // namespace VORK::FILEINDEXCTL
