/// \file
/// Is the indexing daemon there?
#ifndef FILEINDEXCTL_DAEMON_H
#define FILEINDEXCTL_DAEMON_H

#include <json/value.h>

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
    std::string text;
    DaemonCondition condition;
    std::optional<bool> listens;  ///< to whomever; nothing when it cannot be told

    /// "daemon" for programs: whether it listens, null when that cannot be told.
    Json::Value ForPrograms() const { return listens ? Json::Value(*listens) : Json::Value(); }
};

/// Asks the kernel who listens. Only when it sees nobody, a connection is tried, without sending anything: a
/// daemon in another network namespace is found in that way, and will note an empty command.
DaemonState ProbeDaemon();

}  // namespace fileindexctl

#endif
