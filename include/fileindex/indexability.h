/// \file
/// Which names, paths and shares may be indexed at present. Stateless; asks the platform at each call.
///
/// Except where said, a "no" writes no record and sets no code.
#ifndef FILEINDEX_INDEXABILITY_H
#define FILEINDEX_INDEXABILITY_H

#include <fileindex/export.h>

#include <string>

struct _tag_VORKSHARE;  // the platform's share record

namespace VORK {
namespace FILEINDEX {

/// Does this single path component belong to the system: the platform's metadata directories, the index's own
/// files, and a few well-known names (case counts)?
FILEINDEX_API bool IsSystemPreservedFileName(const std::string &name);

/// Must the indexer pass over this full path: a system name, inside a share's recycle bin or a snapshot, or on
/// a remote, image or pseudo file system? A path without "/" is passed over too; a file
/// system of unknown type is not.
FILEINDEX_API bool IsSkipIndex(const std::string &fullPath);

/// May a user have this folder (share path) indexed? Unknown share: one record and FILEINDEX_ERR_PATH.
FILEINDEX_API bool CanPathBeIndexed(const std::string &sharePath);

/// The same for a full path, which must be free of links, "." and ".." components, doubled and trailing "/".
/// A file system of unknown type is refused. A path outside every share, an unknown share, a mount point and a
/// path that is not real each write a record; the first also sets FILEINDEX_ERR_PATH.
FILEINDEX_API bool CanFullPathBeIndexed(const std::string &fullPath);

/// Is the share neither excluded by name, nor locked by encryption, nor read-only? A null share is not
/// indexable. The record stays the caller's.
FILEINDEX_API bool CanShareBeIndexed(struct _tag_VORKSHARE *share);

/// Is there room for index data (10 MiB) on the share's volume? A check that fails for any reason but lack of
/// space or quota counts as room. An unknown share writes a record.
FILEINDEX_API bool IsShareSpaceEnough(const std::string &shareName);

}  // namespace FILEINDEX
}  // namespace VORK

#endif
