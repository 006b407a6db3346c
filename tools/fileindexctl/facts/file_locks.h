/// \file
/// Who holds an advisory lock on a file.
#pragma once

#include <string>

namespace VORK::FILEINDEXCTL {

/// The processes that took a lock on the file (flock) and keep it, "process 4711 (rsync -a)"; empty when there are
/// none. Programs hold these locks for milliseconds, so one that is let go within a second is no trouble. Waits
/// only while there is a holder.
std::string LastingLockHolders(const std::string &path);

}  // namespace VORK::FILEINDEXCTL
