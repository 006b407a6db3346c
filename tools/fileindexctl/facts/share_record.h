/// \file
/// The platform's record of a share, for the length of a scope.
#pragma once

#include <vork/share.h>

#include <memory>
#include <string>

namespace VORK::FILEINDEXCTL {

struct ShareDeleter {
    void operator()(VORKSHARE *share) const { VORKShareFree(share); }
};
using SharePointer = std::unique_ptr<VORKSHARE, ShareDeleter>;

/// Null, with the platform error set, when the share cannot be looked up.
inline SharePointer FindShare(const std::string &name) {
    VORKSHARE *share = nullptr;
    return SharePointer(VORKShareGet(name.c_str(), &share) < 0 ? nullptr : share);
}

}  // namespace VORK::FILEINDEXCTL
