/// \file
/// Queue lines in the very form their usual writers give them.
#pragma once

#include <string_view>

namespace VORK::FILEINDEX::internal {

struct OrdinaryEvent;

/// Reads a line whose members stand in byte order, without blanks and without escapes:
///
///     {"data":null,"event":65536,"path":"/vol1/photo"}
///
/// "data" may be missing or hold the four flags; "path_old" may follow. Such a line needs no parser, and nearly
/// all lines are like it. False: it is written otherwise, which says nothing about its being well formed.
bool ReadCompactEvent(std::string_view line, OrdinaryEvent &event);

}  // namespace VORK::FILEINDEX::internal
