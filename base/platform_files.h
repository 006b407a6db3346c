/// \file
/// Files of the Linux platform that others read as well: its interface does not tell everything they hold.
#pragma once

#include <json/value.h>

namespace VORK {

/// The shares, and the search setting.
inline constexpr const char *kPlatformFile = "/usr/vork/etc/platform.conf";

/// What the notification daemon was asked to watch: {"registrations": [{"queue", "name", "config", ...}, ...]}.
inline constexpr const char *kRegistrationsFile = "/usr/vork/etc/vorknotifyd/registrations.json";
inline constexpr const char *kRegistrationsKey = "registrations";

/// Has the document that form? What each watches is not looked at.
bool HoldsRegistrations(const Json::Value &document);

}  // namespace VORK
