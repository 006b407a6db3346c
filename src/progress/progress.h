/// \file
/// How far the indexing of one folder has got, and the words for it.
#pragma once

#include <string>

namespace VORK::FILEINDEX::internal {

inline constexpr char kFinished[] = "finished";
inline constexpr char kPaused[] = "paused";
inline constexpr char kProcessing[] = "processing";
inline constexpr char kNoSpace[] = "err_no_space";

/// The word for a folder or service with work left: "paused" or "processing".
const char *ProgressOfWork(long long resumeTime);

/// StatusMgr::GetFolderStatus.
std::string FolderProgress(const std::string &path);

}  // namespace VORK::FILEINDEX::internal
