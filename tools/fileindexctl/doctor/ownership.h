/// \file
/// Owner and mode of the library's files.
#ifndef FILEINDEXCTL_DOCTOR_OWNERSHIP_H
#define FILEINDEXCTL_DOCTOR_OWNERSHIP_H

#include "finding.h"

#include <string>

namespace fileindexctl::doctor {

/// Findings about a regular file that is to belong to root, with mode 0644. Nothing for one that is not there.
Findings CheckOwnership(const std::string &path, const std::string &why);

}  // namespace fileindexctl::doctor

#endif
