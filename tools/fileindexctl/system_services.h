/// \file
/// The services of this machine, by the names that its service manager knows.
#ifndef FILEINDEXCTL_SYSTEM_SERVICES_H
#define FILEINDEXCTL_SYSTEM_SERVICES_H

#include <string>

namespace fileindexctl {

bool RunsSystemd();

/// The answer of "systemctl QUESTION NAME.service".
bool Systemctl(const char *question, const std::string &name);

/// Is there a unit, or without systemd an init script, of that name?
bool IsServiceKnown(const std::string &name);

bool IsFileSharingThere();

}  // namespace fileindexctl

#endif
