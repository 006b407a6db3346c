/// \file
/// The library's changes of the list of folders, step by step.
#pragma once

#include "facts/paths.h"
#include "report/failure.h"
#include "report/steps.h"

#include <json/value.h>

#include <optional>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

/// Why a full path is no folder: what is missing (status 66), or a file stands there or no name is that long (64);
/// nothing when it is one, or cannot be looked at.
std::optional<Failure> WhyNoFolder(const std::string &fullPath);

/// Warns when the folder (share path, full path) cannot be indexed as things are, or the indexer passes over it.
void WarnOfObstacle(const std::string &path, const std::string &fullPath, Output &output);

/// What a change does to the file-sharing service, which is restarted when search is switched on (by any folder
/// that is saved while it is off) or off (by the removal of the last one): "the file-sharing service is restarted:
/// ...". Empty when it does not.
std::string RestartWith(bool savesFolders, bool leavesNone);

/// Says so on stderr, before it is done.
void AnnounceRestart(const std::string &restart, Output &output);

/// Adds or changes the folders of an array of records, all or none. Throws Failure when nothing was done.
StepReport PerformUpsert(const Json::Value &records, Patience &patience);

/// Folders to be removed.
struct Removal {
    std::vector<std::string> present{};  ///< on shares that are there
    std::vector<std::string> away{};     ///< on shares that are not: their queues and monitors cannot be reached

    bool Contains(const std::string &path) const;
    void Add(const std::string &path);
    std::vector<std::string> All() const;
};

/// What the removal means, for a question; `folders` are those before it.
std::string ConsequenceOf(const Removal &removal, const Folders &folders);

/// Removes the folders; the names of steps that save begin with `saved`. Those on shares that are away come last,
/// and only when everything before succeeded: `removed` says what was tried. Throws Failure when nothing was done.
StepReport PerformRemoval(const std::string &saved, const Removal &removal, std::vector<std::string> &removed,
                          Patience &patience);

}  // namespace VORK::FILEINDEXCTL
