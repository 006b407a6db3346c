/// \file
/// What a run of the tool ends with. The numbers are those of sysexits.h where it has one that fits, and are part
/// of the interface: scripts test them.
#pragma once

#include <span>
#include <string_view>

namespace VORK::FILEINDEXCTL {

enum class ExitStatus {
    kDone = 0,            ///< done, or the answer is yes
    kNo = 1,              ///< the answer is no, or the person asked said no
    kUsage = 64,          ///< the command line is wrong or makes no sense
    kMalformed = 65,      ///< a configuration file is not what it should be
    kNoSuchFolder = 66,   ///< no such folder, or no such share
    kUnreachable = 69,    ///< the daemon or a service failed, and nothing has been changed
    kPartly = 70,         ///< something was changed and a later step failed; what was done is printed
    kCannotSave = 73,     ///< no room: a file cannot be written, or the list of folders is full
    kBusy = 75,           ///< a lock is held by somebody else; try again
    kPermission = 77,     ///< the files may not be read or written by this user
    kNotConfigured = 78,  ///< the platform knows no shares, or this share cannot be used
};

struct ExitMeaning {
    ExitStatus status;
    std::string_view words;
    std::string_view sentence;
};

/// All of them, for the help and the manual page.
std::span<const ExitMeaning> ExitMeanings();

}  // namespace VORK::FILEINDEXCTL
