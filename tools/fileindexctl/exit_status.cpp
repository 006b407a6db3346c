#include "exit_status.h"

namespace fileindexctl {

namespace {

constexpr ExitMeaning kMeanings[] = {
    {ExitStatus::Done, "done or yes", "Done, or the answer is yes."},
    {ExitStatus::No, "no", "The answer is no, or the person asked said no."},
    {ExitStatus::Usage, "usage", "The command line is wrong or makes no sense."},
    {ExitStatus::Malformed, "malformed configuration",
     "A configuration file, or one to be imported, is not what it should be."},
    {ExitStatus::NoSuchFolder, "no such folder, share or file", "There is no such folder, share or file."},
    {ExitStatus::Unreachable, "daemon or service failed with nothing changed",
     "The daemon or a service failed, and nothing has been changed."},
    {ExitStatus::Partly, "partly done",
     "Something was changed and a later step failed; what was done is printed."},
    {ExitStatus::CannotSave, "cannot save",
     "There is no room: a file cannot be written, a share is full, or there are 1000 folders already."},
    {ExitStatus::Busy, "lock busy", "A lock is held by another program; try again."},
    {ExitStatus::Permission, "permission",
     "This user may not read or write the files, or a lock file belongs to another user."},
    {ExitStatus::NotConfigured, "platform not configured",
     "The platform knows no shares, or this share cannot be used."},
};

}  // namespace

std::span<const ExitMeaning> ExitMeanings() {
    return kMeanings;
}

}  // namespace fileindexctl
