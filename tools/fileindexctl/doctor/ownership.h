/// \file
/// Owner and mode of files and directories.
#pragma once

#include "doctor/finding.h"

#include <sys/stat.h>

#include <string>

namespace VORK::FILEINDEXCTL::DOCTOR {

/// What a mode has to have, and what it may not have.
struct Modes {
    mode_t required;
    mode_t forbidden;
};
inline constexpr Modes kReadByAll{0644, 07133};
inline constexpr Modes kClosed{0600, 07177};
inline constexpr Modes kNotForOthersToWrite{0, 0022};

/// Findings about a regular file or a directory that is to belong to root. Nothing for one that is not there, nor
/// for a link. A file with further names is left to people: its owner may have meant another one of them.
Findings CheckOwnership(const std::string &path, Modes modes, const std::string &why);

}  // namespace VORK::FILEINDEXCTL::DOCTOR
