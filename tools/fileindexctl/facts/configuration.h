/// \file
/// Both configuration files as one document, for "export" and "import":
/// {"version": 1, "folder": {PATH: RECORD, ...}, "status": {...}}, with the members that the files have.
#pragma once

#include <json/value.h>

#include <map>
#include <optional>
#include <set>
#include <string>

namespace VORK::FILEINDEXCTL {

/// What status.conf says, without its loose forms: flags are sets, and a pause that has ended is none.
struct StatusSettings {
    long long resumeTime = -1;
    std::set<std::string> noSpace{};
    std::set<std::string> needReindex{};
    std::set<std::string> markers{};
};

using FolderRecords = std::map<std::string, Json::Value>;

/// A part that is missing is not to be touched.
struct Configuration {
    std::optional<FolderRecords> folders;
    std::optional<StatusSettings> status;
};

/// What is stored now. Throws Failure.
FolderRecords StoredFolders();
StatusSettings StoredStatus();

Json::Value DocumentOf(const FolderRecords &folders, const StatusSettings &status);

/// Checks the whole text. Throws Failure, which names `source` and the member at fault.
Configuration ParseConfiguration(const std::string &text, const std::string &source);

}  // namespace VORK::FILEINDEXCTL
