/// \file
/// What the platform knows of a share.
#pragma once

#include "src/names.h"

#include <vork/share.h>

#include <array>
#include <memory>
#include <optional>
#include <string>
#include <utility>

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

/// The name and the directory of the share that holds a full path; nothing when none does.
inline std::optional<std::pair<std::string, std::string>> ShareHolding(const std::string &fullPath) {
    std::array<char, VORK::FILEINDEX::internal::kShareNameSize> name{};
    std::array<char, VORK::FILEINDEX::internal::kPathSize> directory{};
    if (VORKShareNamePathGet(fullPath.c_str(), name.data(), name.size(), directory.data(), directory.size()) < 0) {
        return std::nullopt;
    }
    return std::pair(std::string(name.data()), std::string(directory.data()));
}

}  // namespace VORK::FILEINDEXCTL
