/// \file
/// The lines of a share's event queue file, for everyone who reads one.
///
/// The daemon consumes and other processes append while we read: a scan sees what is there when it gets to it.
#ifndef FILEINDEX_SRC_UTILS_QUEUE_FILE_H
#define FILEINDEX_SRC_UTILS_QUEUE_FILE_H

#include <functional>
#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

/// A well-formed line: an object with "event", convertible to unsigned, and "path", a string.
struct QueueEvent {
    unsigned type = 0;
    std::string path;
    std::string oldPath;  ///< "path_old" of a rename event; empty when absent or not a string
};

/// Gets each line without its newline (of one beyond 1 MiB only the beginning), and its event or null when it is
/// malformed. False ends the scan.
using QueueVisitor = std::function<bool(std::string_view line, const QueueEvent *event)>;

/// Visits the lines in order; a last one without a newline counts. False when the file cannot be opened as a
/// regular file, with the reason in `errno`. Takes no lock and holds at most one line in memory.
bool ScanQueue(const std::string &queueFile, const QueueVisitor &visit);

}  // namespace VORK::FILEINDEX::internal

#endif
