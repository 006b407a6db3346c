/// \file
/// What people are told of times ("indexing is paused until ...", "12 min" ago), and how a pause is set.
#pragma once

#include "report/steps.h"

#include <limits>
#include <optional>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

/// \name Ends of a pause that are no points in time
/// @{
inline constexpr long long kNotPaused = -1;
inline constexpr long long kWithoutEnd = 0;
/// @}

/// The library and the daemon reckon pauses in 32 bits: a later end would wrap and end the pause at once.
inline constexpr long long kLatestEnd = std::numeric_limits<int>::max();

/// A point in time as local clocks show it.
std::string LocalTime(long long seconds, const char *format = "%Y-%m-%d %H:%M %Z");

/// Lets a pause end then, or indexing go on for kNotPaused; the first step is called `saved`. Throws Failure when
/// nothing was done.
StepReport SetPause(long long resumeTime, const std::string &saved, Patience &patience);

/// The same for a pause that ends after so many hours; 0 for one without an end.
StepReport PauseForHours(int hours, const std::string &saved, Patience &patience);

/// "indexing is paused until 2025-03-01 07:00 CET", for a time as StatusMgr::GetPauseInfo gives it.
std::string PauseText(long long resumeTime);

/// How long ago that was: "12 min"; "-" when it is not known.
std::string AgeText(const std::optional<long long> &since);

/// "pause --run": pauses while the command runs, and ends with its exit status. Throws Failure when indexing
/// cannot be paused; the command is not run then.
ExitStatus PauseWhile(const std::vector<std::string> &command, Patience patience, Output &output);

/// Does a pause with such an end hold now?
bool IsPaused(long long resumeTime);

}  // namespace VORK::FILEINDEXCTL
