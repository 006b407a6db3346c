/// \file
/// Share paths, full paths and share names. Stateless; nothing is normalised or resolved.
///
/// A share path names a folder by its share, "/media/photos/trip"; a full path by its place on the volume,
/// "/vol1/media/photos/trip" when the share media is at /vol1/media.
#ifndef FILEINDEX_PATHS_H
#define FILEINDEX_PATHS_H

#include <fileindex/export.h>

#include <string>

namespace VORK {
namespace FILEINDEX {

/// "/media/photos" -> "/vol1/media/photos": the directory above the share's own, followed by the share path as it
/// is. So a share's directory must bear the share's name. Unknown share: FILEINDEX_ERR_PATH, false, no record,
/// `out` untouched; an empty path: one record, no code.
FILEINDEX_API bool GetFullPath(std::string &out, const std::string &sharePath);

/// "/media/photos" -> "media"; "/" -> "". The first character is skipped whatever it is. False only for an
/// empty path. The share need not exist.
FILEINDEX_API bool GetShareNameByPath(std::string &outShareName, const std::string &sharePath);

/// "/vol1/media/photos" -> "media" and "/vol1/media". Outside every share: one record, FILEINDEX_ERR_PATH,
/// false, both untouched.
FILEINDEX_API bool GetShareNamePathByFullPath(std::string &outShareName, std::string &outSharePath,
                                              const std::string &fullPath);

/// ("/old/a/b", "new") -> "/new/a/b"; ("/old", "new") -> "/new"; ("", "new") -> "".
FILEINDEX_API std::string ReplaceShareName(const std::string &sharePath, const std::string &newShareName);

/// Byte comparison; an empty prefix always matches. Knows nothing of path components.
FILEINDEX_API bool StringStartWith(const std::string &str, const std::string &prefix);

/// Is there a directory, and not a link to one?
FILEINDEX_API bool IsDirExist(const std::string &path);

/// Is there a regular file, and not a link to one?
FILEINDEX_API bool IsFileExist(const std::string &path);

}  // namespace FILEINDEX
}  // namespace VORK

#endif
