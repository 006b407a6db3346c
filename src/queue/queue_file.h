/// \file
/// The lines of a share's event queue file, for everyone who reads one.
///
/// The daemon consumes and other processes append while we read: a scan sees what is there when it gets to it.
/// Lines are separated by "\n"; a last one without it counts. No lock is taken, and no more than a block, or one
/// line if that is longer, is held in memory. A hole in the file reads as NULs and so makes its line malformed; a
/// large one is passed over without being read.
#pragma once

#include <sys/types.h>

#include <functional>
#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

/// A well-formed line: an object with "event", convertible to unsigned, and "path", a string. The views live until
/// the next line.
struct QueueEvent {
    unsigned type = 0;
    std::string_view path;
    std::string_view oldPath;  ///< "path_old" of a rename event; empty when absent or not a string
    bool whole = true;         ///< false for a last line without its newline, which may yet grow
    off_t offset = 0;          ///< where the line begins in the file
};

/// Gets each line without its newline (of one beyond 1 MiB, or with a large hole in it, only the beginning), and
/// its event or null when it is malformed. False ends the scan.
using QueueVisitor = std::function<bool(std::string_view line, const QueueEvent *event)>;

/// Visits all lines in order. False when the file cannot be opened as the share's own regular file
/// (MetadataEntry), with the reason in `errno`.
bool ScanQueue(const std::string &queueFile, const QueueVisitor &visit);

/// Where a scan of the same file can go on later.
struct QueuePosition {
    dev_t device = 0;
    ino_t inode = 0;
    off_t offset = 0;  ///< after the last whole line
};

/// Visits all lines from `position` on: from the start when the file at the path is another one by now or has
/// become shorter. Moves `position` past the last whole line; a line without its newline is visited now and again
/// later. Result as ScanQueue.
///
/// `restarted` is called before the first line when the scan begins at the start.
bool ScanQueueFrom(const std::string &queueFile, QueuePosition &position, const std::function<void()> &restarted,
                   const QueueVisitor &visit);

/// Does a well-formed line of exactly that type and path begin at the offset?
bool IsInQueueAt(const std::string &queueFile, off_t offset, unsigned type, const std::string &path);

/// Is there a well-formed line of exactly that type and path? Result as ScanQueue; `found` is false when that is.
///
/// Several times faster than a scan that looks at every line.
bool FindInQueue(const std::string &queueFile, unsigned type, const std::string &path, bool &found);

}  // namespace VORK::FILEINDEX::internal
