/// \file
/// Is the indexing daemon there?
#pragma once

#include "src/names.h"

#include <json/value.h>

#include <optional>
#include <string>

namespace VORK::FILEINDEXCTL {

using VORK::FILEINDEX::internal::kDaemonSocket;

enum class DaemonCondition {
    kListening,
    kFull,    ///< listens, but has many connections to accept first
    kAbsent,  ///< there is no socket
    kStale,   ///< there is one, and nobody behind it
    kDenied,
    kUnknown,
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

}  // namespace VORK::FILEINDEXCTL
