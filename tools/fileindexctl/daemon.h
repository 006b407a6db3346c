/// \file
/// Is the indexing daemon there?
#ifndef FILEINDEXCTL_DAEMON_H
#define FILEINDEXCTL_DAEMON_H

#include <optional>
#include <string>

namespace fileindexctl {

inline constexpr const char *kDaemonSocket = "/var/run/fileindexd.sock";

enum class DaemonCondition {
    Listening,
    Full,    ///< listens, but has many connections to accept first
    Absent,  ///< there is no socket
    Stale,   ///< there is one, and nobody behind it
    Denied,
    Unknown,
};

struct DaemonState {
    bool reachable;  ///< by this user
    std::string text;
    DaemonCondition condition;
    std::optional<bool> listens;  ///< nothing when it cannot be told
};

/// Asks the kernel who listens. Only when it sees nobody, a connection is tried, without sending anything: a
/// daemon in another network namespace is found in that way, and will note an empty command.
DaemonState ProbeDaemon();

}  // namespace fileindexctl

#endif
