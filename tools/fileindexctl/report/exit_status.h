/// \file
/// What a run of the tool ends with. The numbers are those of sysexits.h where it has one that fits, and are part
/// of the interface: scripts test them.
#pragma once

#include <string_view>

namespace VORK::FILEINDEXCTL {

enum class ExitStatus {
    kDone = 0,
    kNo = 1,
    kUsage = 64,
    kMalformed = 65,
    kNoSuchFolder = 66,
    kUnreachable = 69,
    kPartly = 70,
    kCannotSave = 73,
    kBusy = 75,
    kPermission = 77,
    kNotConfigured = 78,
};

/// For the help and the manual page.
struct ExitMeaning {
    ExitStatus status;
    std::string_view words;
    std::string_view sentence;
};

inline constexpr ExitMeaning kExitMeanings[] = {
    {ExitStatus::kDone, "done or yes", "Done, or the answer is yes."},
    {ExitStatus::kNo, "no", "The answer is no, or the person asked said no."},
    {ExitStatus::kUsage, "usage", "The command line is wrong or makes no sense."},
    {ExitStatus::kMalformed, "malformed configuration",
     "A configuration file, or one to be imported, is not what it should be."},
    {ExitStatus::kNoSuchFolder, "no such folder, share or file", "There is no such folder, share or file."},
    {ExitStatus::kUnreachable, "daemon or service failed with nothing changed",
     "The daemon or a service failed, and nothing has been changed."},
    {ExitStatus::kPartly, "partly done",
     "Something was changed and a later step failed; what was done is printed."},
    {ExitStatus::kCannotSave, "cannot save",
     "There is no room: a file cannot be written, a share is full, or there are 1000 folders already."},
    {ExitStatus::kBusy, "lock busy", "A lock is held by another program; try again."},
    {ExitStatus::kPermission, "permission",
     "This user may not read or write the files, or a lock file belongs to another user."},
    {ExitStatus::kNotConfigured, "platform not configured",
     "The platform knows no shares, or this share cannot be used."},
};

}  // namespace VORK::FILEINDEXCTL
