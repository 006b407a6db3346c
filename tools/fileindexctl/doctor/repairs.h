/// \file
/// Mending what was found.
#ifndef FILEINDEXCTL_DOCTOR_REPAIRS_H
#define FILEINDEXCTL_DOCTOR_REPAIRS_H

#include "../output.h"
#include "../patience.h"
#include "finding.h"

#include <string>

namespace fileindexctl::doctor {

/// Gives the file another name, with the time in it, and answers that. Throws Failure.
std::string SetAside(const std::string &path);

/// The same, for a copy; empty when there is nothing to copy.
std::string KeepCopy(const std::string &path);

/// Says what would change.
void ShowDifference(const Repairs &repairs, Output &output);

/// Changes it, keeping a copy beside each file whose content changes. A repair that fails is reported as a
/// warning, and the others go on.
void CarryOut(const Repairs &repairs, Patience &patience, Output &output);

}  // namespace fileindexctl::doctor

#endif
