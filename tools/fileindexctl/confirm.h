/// \file
/// Consent to what deletes.
#ifndef FILEINDEXCTL_CONFIRM_H
#define FILEINDEXCTL_CONFIRM_H

#include "arguments.h"

#include <string>

namespace fileindexctl {

/// Passes with --yes, or when a person at the terminal agrees. Throws Failure otherwise: a program that cannot
/// be asked has to say --yes.
void RequireConsent(const Arguments &arguments, const std::string &consequence);

}  // namespace fileindexctl

#endif
