/// \file
/// The registrations kept for the notification daemon.
#pragma once

#include <json/value.h>

#include <string>

namespace VORK::PLATFORM {

/// Whether the description has the documented form.
bool IsDescription(const Json::Value &description);

/// Stores the registration in place of a former one of the same queue and name. False with the platform error
/// set, and everything as it was, on failure.
bool StoreRegistration(const Json::Value &description, const std::string &name, int type);

/// Removes the registration if there is one. Result as above.
bool RemoveRegistration(const std::string &queuePath, const std::string &name);

}  // namespace VORK::PLATFORM
