/// \file
/// Who holds an advisory lock on a file.
#pragma once

#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

struct LockHolder {
    int process;
    std::string command;  ///< with its arguments; empty when it cannot be told

    bool operator==(const LockHolder &) const = default;
};

/// The processes that took a lock on the file (flock) and still hold it.
std::vector<LockHolder> LockHolders(const std::string &path);

/// The same, for who keeps it: programs hold these locks for milliseconds, so a lock that is let go within a
/// second is no trouble. Waits only while there is a holder.
std::vector<LockHolder> LastingLockHolders(const std::string &path);

/// "process 4711 (rsync -a)".
std::string HolderText(const std::vector<LockHolder> &holders);

}  // namespace VORK::FILEINDEXCTL
