/// \file
/// Which names, paths and shares may be indexed at present. Stateless; asks the platform at each call.
///
/// Except where said, a "no" writes no record and sets no code. A name or path with a NUL in it names nothing, and
/// the platform is not asked about what stands before the NUL.
#ifndef FILEINDEX_INDEXABILITY_H
#define FILEINDEX_INDEXABILITY_H

#include <fileindex/export.h>

#include <string>

struct _tag_VORKSHARE;  // the platform's share record

namespace VORK {
namespace FILEINDEX {

/// Does this single path component belong to the system: the platform's metadata directories, the index's own
/// files, and a few well-known names (case counts)? Not a name with a NUL.
FILEINDEX_API bool IsSystemPreservedFileName(const std::string &name);

/// Must the indexer pass over this full path: a system name, inside a share's recycle bin or a snapshot, or on
/// a remote, image or pseudo file system? A path without "/" and one with a NUL are passed over too; a file system
/// of unknown type is not.
FILEINDEX_API bool IsSkipIndex(const std::string &fullPath);

/// May a user have this folder (share path) indexed? Unknown share: record utils.cpp:191 and FILEINDEX_ERR_PATH;
/// an empty path: records 389 and 191, and the same code. Else as CanFullPathBeIndexed.
FILEINDEX_API bool CanPathBeIndexed(const std::string &sharePath);

/// The same for a full path, which must be free of links, "." and ".." components, doubled and trailing "/".
/// A file system of unknown type is refused. Records, all of utils.cpp: 418 and 239 for a path outside every share
/// or with a NUL, with FILEINDEX_ERR_PATH; without a code 245 for an unknown share, 256 for a mount point and 263
/// for a path that is not real.
FILEINDEX_API bool CanFullPathBeIndexed(const std::string &fullPath);

/// Is the share neither excluded by name, nor locked by encryption, nor read-only? A null share is not
/// indexable. The record stays the caller's.
FILEINDEX_API bool CanShareBeIndexed(struct _tag_VORKSHARE *share);

/// Is there room for index data (10 MiB) on the share's volume? A check that fails for any reason but lack of
/// space or quota counts as room. An unknown share: no, and record utils.cpp:361.
FILEINDEX_API bool IsShareSpaceEnough(const std::string &shareName);

}  // namespace FILEINDEX
}  // namespace VORK

#endif
