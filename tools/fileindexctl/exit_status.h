/// \file
/// What a run of the tool ends with. The numbers are those of sysexits.h where it has one that fits, and are part
/// of the interface: scripts test them.
#ifndef FILEINDEXCTL_EXIT_STATUS_H
#define FILEINDEXCTL_EXIT_STATUS_H

#include <span>
#include <string_view>

namespace fileindexctl {

enum class ExitStatus {
    Done = 0,            ///< done, or the answer is yes
    No = 1,              ///< the answer is no, or the person asked said no
    Usage = 64,          ///< the command line is wrong or makes no sense
    Malformed = 65,      ///< a configuration file is not what it should be
    NoSuchFolder = 66,   ///< no such folder, or no such share
    Unreachable = 69,    ///< the daemon or a service failed, and nothing has been changed
    Partly = 70,         ///< something was changed and a later step failed; what was done is printed
    CannotSave = 73,     ///< no room: a file cannot be written, or the list of folders is full
    Busy = 75,           ///< a lock is held by somebody else; try again
    Permission = 77,     ///< the files may not be read or written by this user
    NotConfigured = 78,  ///< the platform knows no shares, or this share cannot be used
};

struct ExitMeaning {
    ExitStatus status;
    std::string_view words;
    std::string_view sentence;
};

/// All of them, for the help and the manual page.
std::span<const ExitMeaning> ExitMeanings();

}  // namespace fileindexctl

#endif
