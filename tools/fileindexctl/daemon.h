/// \file
/// Is the indexing daemon there?
#ifndef FILEINDEXCTL_DAEMON_H
#define FILEINDEXCTL_DAEMON_H

#include <string>

namespace fileindexctl {

struct DaemonState {
    bool reachable;
    std::string text;
};

/// Connects to the daemon's socket, sends nothing and hangs up. Does not wait.
DaemonState ProbeDaemon();

}  // namespace fileindexctl

#endif
