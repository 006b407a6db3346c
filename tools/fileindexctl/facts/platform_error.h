/// \file
/// The platform's error codes in words.
#pragma once

#include <string>

namespace VORK::FILEINDEXCTL {

/// What the "err=[0x1500 ...]" of a log record means, or, for a record on the monitor, the error that the platform
/// has just left; empty when there is none, or one that needs no words.
std::string PlatformErrorOf(const std::string &record);

}  // namespace VORK::FILEINDEXCTL
