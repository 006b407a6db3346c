/// \file
/// Removing files in shares, whose users may exchange directories for links meanwhile.
#pragma once

namespace VORK::PLATFORM {

/// Runs "/bin/rm OPTIONS NAME" in the directory that holds the last name of the path; its exit status. The
/// directory is opened first, in a share, without following a link, and it must be root's: what is put in its
/// place while rm runs does not matter then. Where that cannot be had, nothing is run and the result is 1, with
/// the platform error.
int RemoveInShare(const char *options, const char *path);

}  // namespace VORK::PLATFORM
