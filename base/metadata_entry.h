/// \file
/// What lies in a share's metadata directory, reached so that no link leads elsewhere.
///
/// The share's directory may belong to its users, who can put a link in the place of the metadata directory at any
/// moment, and the process may be root's. So that directory is opened once, not through a link, and whatever
/// follows is done in it by name.
#pragma once

#include "base/unique_fd.h"

#include <sys/stat.h>
#include <sys/types.h>

#include <string>

namespace VORK {

/// A name in the directory. Where the directory could not be opened, or is a link, everything fails. The reason of
/// a failure is in `errno`.
class MetadataEntry {
public:
    /// `path`: the entry's, absolute.
    explicit MetadataEntry(const std::string &path);

    /// Opens the entry, never through a link and without waiting, and tells what it is. A file with a second name
    /// is refused like one that is not regular: it would be somebody else's file that is read, or written.
    UniqueFd OpenFile(int flags, struct stat &status) const;

    /// Tells what the name stands for, a link for itself.
    bool Look(struct stat &status) const;

    bool MakeDirectory(mode_t mode) const;

private:
    /// Sets `errno` for a directory that could not be opened.
    bool HasDirectory() const;

    UniqueFd directory_;
    std::string name_;
    int error_ = 0;
};

}  // namespace VORK
