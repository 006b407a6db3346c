/// \file
/// The library's changes of the list of folders, step by step.
#pragma once

#include "facts/patience.h"
#include "report/steps.h"
#include "verbs/verb.h"

#include <functional>
#include <optional>

namespace VORK::FILEINDEXCTL {

/// Why a full path is no folder: what is missing (status 66), or a file stands there or no name is that long (64);
/// nothing when it is one, or cannot be looked at.
std::optional<Failure> WhyNoFolder(const std::string &fullPath);

/// Warns when the folder (share path, full path) cannot be indexed as things are, or the indexer passes over it.
void WarnOfObstacle(const std::string &path, const std::string &fullPath, Output &output);

/// What a change does to the file-sharing service, which is restarted when search is switched on (by any folder
/// that is saved while it is off) or off (by the removal of the last one): "the file-sharing service will be
/// restarted, because ...". Empty when it does not.
std::string RestartWith(bool savesFolders, bool leavesNone);

/// Says so on stderr, before it is done.
void AnnounceRestart(const std::string &restart, Output &output);

/// "1 folder is indexed": all that there are now, also as "total".
void StateTotal(std::size_t total, Output &output);

/// Adds or changes the folders of an array of records, all or none. Throws Failure when nothing was done.
StepReport PerformUpsert(const Json::Value &records, Patience &patience);

/// Puts the folders on shares that are away last, and gives the first of them: their queues and monitors cannot be
/// reached.
Paths::iterator FirstAway(Paths &paths);

/// The paths of the folders that are left.
Paths Without(const Folders &folders, const Paths &removed);

/// The first steps of a removal that leaves no folder: it stops the service, and then nobody is told anything.
std::vector<PlannedStep> StopPlan(const std::string &saved, const Mark &stop, const Mark &search,
                                  const Mark &restart);

/// Takes the steps of a change. Throws Failure when nothing was done.
StepReport PerformPlan(const std::vector<PlannedStep> &plan, bool switchesSearchOn, Patience &patience,
                       const std::function<bool()> &call);

/// What the removal of these paths means, for a question; `folders` are those before it.
std::string ConsequenceOf(const Paths &removed, const Folders &folders);

/// Removes the folders; the names of steps that save begin with `saved`. Those on shares that are away come last,
/// and only when everything before succeeded: `paths` becomes what was tried. Throws Failure when nothing was
/// done.
StepReport PerformRemoval(const std::string &saved, Paths &paths, Patience &patience);

}  // namespace VORK::FILEINDEXCTL
