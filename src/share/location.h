/// \file
/// Where a share keeps its index data, for names that are strings.
#pragma once

#include "base/has_nul.h"
#include "names.h"

#include <fileindex/fileidx.h>

#include <string>

namespace VORK::FILEINDEX::internal {

/// FILEIDXQueuePathGet; -1 also for a name with a NUL.
inline int QueuePathOf(const std::string &share, char (&buffer)[kPathSize]) {
    return HasNul(share) ? -1 : FILEIDXQueuePathGet(share.c_str(), buffer, kPathSize);
}

}  // namespace VORK::FILEINDEX::internal
