/// \file
/// The last error code and the log level, both process-wide.
///
/// Neither is per thread: concurrent failures overwrite each other, and the last wins.
/// Most failures also write a record to the system log (`syslog`, LOG_ERR, "file:line message"), and each layer
/// that fails because of it adds its own; the library never calls `openlog`, so identity and facility are the
/// host's.
#ifndef FILEINDEX_ERROR_H
#define FILEINDEX_ERROR_H

#include <fileindex/export.h>

namespace VORK {
namespace FILEINDEX {

/// Why an operation failed. The values are fixed: management programs store and translate them.
enum _tag_fileindex_err_ {
    FILEINDEX_ERR_NONE = 0,               ///< nothing has failed since the library was loaded
    FILEINDEX_ERR_BAD_PARAM = 1,          ///< a malformed argument
    FILEINDEX_ERR_PATH = 2,               ///< a path or share that cannot be resolved to a volume path
    FILEINDEX_ERR_RESERVED = 3,           ///< never set; the number is reserved
    FILEINDEX_ERR_NO_SUCH_FOLDER = 4,     ///< no record under that path
    FILEINDEX_ERR_EXCEED_MAX_FOLDER = 5,  ///< the 1001st folder
    FILEINDEX_ERR_LOAD_JSON = 6,          ///< a configuration file exists but cannot be read as JSON
    FILEINDEX_ERR_SAVE_JSON = 7,          ///< a configuration file cannot be written; it stays as it was
    FILEINDEX_ERR_MALFORMED_CONFIG = 8,   ///< folder.conf is JSON, but not an object
    FILEINDEX_ERR_LOCK = 9                ///< a lock file is busy or cannot be used; try again later
};

/// The code of the last failure. Read it only after a call has failed: success never resets it.
class ErrorHandler {
public:
    /// Stores `code`; no log record.
    FILEINDEX_API static void SetError(_tag_fileindex_err_ code);

    /// The code of the last failure in this process, by any thread; FILEINDEX_ERR_NONE before the first.
    FILEINDEX_API static _tag_fileindex_err_ GetError();

    /// The code itself, for older programs that read it as a variable. Call GetError instead.
    FILEINDEX_API static _tag_fileindex_err_ g_error_code;
};

/// At 7, the three debug records of the queue writer are written (short write, hard lock failure, lock busy three
/// times); at every other value they are not. All other records are written at any level. The initial value is 3.
FILEINDEX_API extern int LOG_LEVEL;

}  // namespace FILEINDEX
}  // namespace VORK

#endif
