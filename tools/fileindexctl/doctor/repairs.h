/// \file
/// Mending what was found.
#ifndef FILEINDEXCTL_DOCTOR_REPAIRS_H
#define FILEINDEXCTL_DOCTOR_REPAIRS_H

#include "../output.h"
#include "../patience.h"
#include "finding.h"

#include <vector>

namespace fileindexctl::doctor {

using Repairs = std::vector<Repair>;

/// Says what would change.
void ShowDifference(const Repairs &repairs, Output &output);

/// Changes it, keeping a copy beside each file whose content changes. A repair that fails is reported as a
/// warning, and the others go on.
void CarryOut(const Repairs &repairs, Patience &patience, Output &output);

}  // namespace fileindexctl::doctor

#endif
