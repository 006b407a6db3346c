/// \file
/// Mending what was found.
#pragma once

#include "doctor/finding.h"
#include "facts/patience.h"
#include "report/output.h"

#include <string>

namespace VORK::FILEINDEXCTL::DOCTOR {

/// Gives the file another name, with the time in it, and answers that. Throws Failure.
std::string SetAside(const std::string &path);

/// The same, for a copy; empty when there is nothing to copy.
std::string KeepCopy(const std::string &path);

/// Says what would change.
void ShowDifference(const Repairs &repairs, Output &output);

/// Changes it, keeping a copy beside each file whose content changes. A repair that fails is reported as a
/// warning, and the others go on.
void CarryOut(const Repairs &repairs, Patience &patience, Output &output);

}  // namespace VORK::FILEINDEXCTL::DOCTOR
