/// \file
/// Asks before what cannot be undone.
#pragma once

#include "command_line/arguments.h"

#include <string>

namespace VORK::FILEINDEXCTL {

/// Passes with --yes, or when a person at the terminal agrees. Throws Failure otherwise: a program that cannot
/// be asked has to say --yes.
void RequireConsent(const Arguments &arguments, const std::string &consequence);

}  // namespace VORK::FILEINDEXCTL
