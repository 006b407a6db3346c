/// \file
/// Does anybody listen on a Unix socket? Asked of the kernel, so that the listener notices nothing.
#pragma once

#include <string>

namespace VORK::FILEINDEXCTL {

enum class Listener {
    kNotSeen,  ///< nobody, or somebody in another network namespace, or the kernel does not tell
    kListening,
    kFull,  ///< listens, but takes no more connections until it has accepted some
};

/// The listener on the socket file at `path`, and not on one that has been replaced by it.
Listener FindListener(const std::string &path);

}  // namespace VORK::FILEINDEXCTL
