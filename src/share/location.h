/// \file
/// Where a share's index data lies, for names that come as strings.
#pragma once

#include "names.h"

#include <fileindex/fileidx.h>

#include <string>

namespace VORK::FILEINDEX::internal {

/// A name or path with a NUL inside names nothing; as a C string it would name something else.
inline bool HasNul(const std::string &text) {
    return text.find('\0') != std::string::npos;
}

/// FILEIDXQueuePathGet; -1 also for a name that is none.
inline int QueuePathOf(const std::string &share, char (&buffer)[kPathSize]) {
    return HasNul(share) ? -1 : FILEIDXQueuePathGet(share.c_str(), buffer, kPathSize);
}

}  // namespace VORK::FILEINDEX::internal
