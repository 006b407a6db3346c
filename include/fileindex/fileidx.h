/**
 * \file
 * The file-index questions and locations for callers that use plain pointers and integers (C99 and later).
 *
 * Conventions of every function here:
 *  1. Strings are NUL-terminated, borrowed for the call, and are bytes: nothing is normalised or re-encoded.
 *  2. A share path begins with "/" and the share's name ("/photo/2015"); a full path is the place on the
 *     volume ("/vol1/photo/2015"). A function takes the one it names and never converts.
 *  3. The questions answer 1 or 0. They answer 0 to a null pointer and when folder.conf cannot be read.
 *  4. The locations return the length of the text written, without its NUL, or -1. A text that does not fit
 *     is cut to the buffer and always NUL-terminated; the length is that of the cut text.
 *  5. The lock files are not touched, and no exception leaves a function.
 *
 * The class interface is in <fileindex/fileindex.h>.
 */
#ifndef FILEINDEX_FILEIDX_H
#define FILEINDEX_FILEIDX_H

#include <fileindex/export.h>

#ifdef __cplusplus
extern "C" {
#endif

/**
 * Writes the path of the share's event queue file, `SHAREDIR/@eaDir/VORK@file_index_queue`, to `szOutQueuePath`.
 *
 * Makes the metadata directory `@eaDir` if it is missing (a failure to do so is logged and not fatal), never
 * the queue file. -1 on a null pointer or `cbOutLen` below 1 (platform error 0x0D00) and on an unknown share
 * (platform error as the share library left it); then the buffer is untouched. The library's own error code
 * is not set.
 *
 * @param szName          the share's name, not a path
 * @param szOutQueuePath  the caller's buffer
 * @param cbOutLen        its size in bytes; 4096 holds every path the platform can have
 */
FILEINDEX_API int FILEIDXQueuePathGet(const char *szName, char *szOutQueuePath, int cbOutLen);

/**
 * Writes the path of the share's index database directory, `SHAREDIR/@eaDir/VORK@.fileindexdb`, to `szOutDBPath`.
 *
 * As FILEIDXQueuePathGet, and also makes the database directory itself (mode 0777 less the umask), whole even
 * when the text was cut to a short buffer; failing to make it is logged and not fatal. It is not made where
 * `@eaDir` is a link.
 *
 * @param szName        the share's name, not a path
 * @param szOutDBPath   the caller's buffer
 * @param cbOutLen      its size in bytes
 */
FILEINDEX_API int FILEIDXDBPathGet(const char *szName, char *szOutDBPath, int cbOutLen);

/** 1 when the full path `szPath` lies at or under the full path of an indexed folder. */
FILEINDEX_API int FILEIDXIsFullPathIndexed(const char *szPath);

/** 1 when the share path `szPath` lies at or under an indexed folder. */
FILEINDEX_API int FILEIDXIsPathIndexed(const char *szPath);

/** 1 when some indexed folder belongs to the share named `szShare` (exactly, case included). */
FILEINDEX_API int FILEIDXIsShareIndexed(const char *szShare);

#ifdef __cplusplus
}
#endif

#endif
