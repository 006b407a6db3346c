/// \file
/// The services of this machine, by the names that its service manager knows.
#pragma once

#include <string>

namespace VORK::FILEINDEXCTL {

bool RunsSystemd();

/// The answer of "systemctl QUESTION NAME.service".
bool Systemctl(const char *question, const std::string &name);

/// Is there a unit, or without systemd an init script, of that name?
bool IsServiceKnown(const std::string &name);

bool IsFileSharingThere();

}  // namespace VORK::FILEINDEXCTL
