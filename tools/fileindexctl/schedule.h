/// \file
/// Times of resumption in words.
#ifndef FILEINDEXCTL_SCHEDULE_H
#define FILEINDEXCTL_SCHEDULE_H

#include <string>

namespace fileindexctl {

/// "indexing is paused until 2025-03-01 07:00 CET", for a time as StatusMgr::GetPauseInfo gives it.
std::string PauseText(long long resumeTime);

}  // namespace fileindexctl

#endif
