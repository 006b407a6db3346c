/// \file
/// What the notification daemon was asked to watch, as the Linux platform keeps it. The platform's interface can
/// change registrations, not tell them.
#pragma once

#include "base/platform_files.h"
#include "facts/paths.h"
#include "report/output.h"
#include "src/names.h"

#include <map>
#include <set>
#include <string>

namespace VORK::FILEINDEXCTL {

/// The name under which the library registers.
inline constexpr const char *kRegistration = VORK::FILEINDEX::internal::kMonitorName;

/// By full path, how it is watched: the rest of its entry, as text.
using Watches = std::map<std::string, std::string>;

/// The library's registrations, by the path of their queue. Throws Failure.
std::map<std::string, Watches> ReadRegistrations();

/// Is the share with this queue paused? All that a pause leaves behind is that nothing is registered for the
/// share, although it has indexed folders, which the caller knows. Not before anything was ever registered. Throws
/// Failure.
bool IsQueuePaused(const std::string &queue);

/// Which of these shares, all with indexed folders, are paused. One that is away is not. Throws Failure.
std::set<std::string> PausedShares(const std::set<std::string> &shares);

/// "the share "photo" is paused (fileindexctl share resume photo)"
std::string PausedText(const std::string &share);

/// Warns of the shares that a change to their folders will have watched again although they are paused: those that
/// are touched, and have indexed folders before and after.
void WarnOfResumption(const std::set<std::string> &touched, const std::set<std::string> &indexed, Output &output);

/// What the library registers for an indexed folder.
Watches::value_type ExpectedWatch(const std::string &fullPath);

}  // namespace VORK::FILEINDEXCTL
