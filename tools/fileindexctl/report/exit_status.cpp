#include "report/exit_status.h"

namespace VORK::FILEINDEXCTL {

namespace {

constexpr ExitMeaning kMeanings[] = {
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

}  // namespace

std::span<const ExitMeaning> ExitMeanings() {
    return kMeanings;
}

}  // namespace VORK::FILEINDEXCTL
