/// \file
/// The platform's error codes in words.
#ifndef FILEINDEXCTL_PLATFORM_ERROR_H
#define FILEINDEXCTL_PLATFORM_ERROR_H

#include <string>

namespace fileindexctl {

/// What the "err=[0x1500 ...]" of a log record means, or, for a record on the monitor, the error that the platform
/// has just left; empty when there is none, or one that needs no words.
std::string PlatformErrorOf(const std::string &record);

}  // namespace fileindexctl

#endif
