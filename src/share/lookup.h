/// \file
/// Shares by their names, as the platform knows them.
#pragma once

#include "base/cancellation.h"
#include "base/has_nul.h"

#include <vork/share.h>

#include <memory>
#include <string>

namespace VORK::FILEINDEX::internal {

struct ShareDeleter {
    void operator()(_tag_VORKSHARE *share) const {
        const NoCancellation freeing;
        VORKShareFree(share);
    }
};
using Share = std::unique_ptr<_tag_VORKSHARE, ShareDeleter>;

/// The share's record; null when there is none, or one without a directory. Calls the platform exactly once, and
/// not at all for a name with a NUL.
inline Share FindShare(const std::string &name) {
    if (HasNul(name)) {
        return nullptr;
    }
    const NoCancellation finding;  // or a record that was just made could get lost on its way here
    _tag_VORKSHARE *record = nullptr;
    if (VORKShareGet(name.c_str(), &record) < 0) {
        return nullptr;
    }
    Share share(record);
    if (share && share->szPath == nullptr) {
        return nullptr;
    }
    return share;
}

}  // namespace VORK::FILEINDEX::internal
