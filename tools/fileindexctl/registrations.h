/// \file
/// What the notification daemon was asked to watch, as the Linux platform keeps it. The platform's interface can
/// change registrations, not tell them.
#ifndef FILEINDEXCTL_REGISTRATIONS_H
#define FILEINDEXCTL_REGISTRATIONS_H

#include <map>
#include <string>

namespace fileindexctl {

/// The name under which the library registers.
inline constexpr const char *kRegistration = "fileindex";

inline constexpr const char *kRegistrationsFile = "/usr/vork/etc/vorknotifyd/registrations.json";

/// By full path, how it is watched: the rest of its entry, as text.
using Watches = std::map<std::string, std::string>;

/// The library's registrations, by the path of their queue. Throws Failure.
std::map<std::string, Watches> ReadRegistrations();

/// What the library registers for an indexed folder.
Watches::value_type ExpectedWatch(const std::string &fullPath);

}  // namespace fileindexctl

#endif
