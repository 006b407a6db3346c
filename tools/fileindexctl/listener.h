/// \file
/// Does anybody listen on a Unix socket? Asked of the kernel, so that the listener notices nothing.
#ifndef FILEINDEXCTL_LISTENER_H
#define FILEINDEXCTL_LISTENER_H

#include <string>

namespace fileindexctl {

enum class Listener {
    NotSeen,  ///< nobody, or somebody in another network namespace, or the kernel does not tell
    Listening,
    Full,  ///< listens, but takes no more connections until it has accepted some
};

/// The listener on the socket file at `path`, and not on one that has been replaced by it.
Listener FindListener(const std::string &path);

}  // namespace fileindexctl

#endif
