/// \file
/// What the library sends: events and commands to the indexing daemon, notifications to the administrators. Most
/// callers want IndexMgr or StatusMgr instead, which save the configuration first.
#ifndef FILEINDEX_DAEMON_H
#define FILEINDEX_DAEMON_H

#include <fileindex/export.h>

#include <json/value.h>

#include <string>

namespace VORK {
namespace FILEINDEX {

/// Appends {"event": type, "path": fullPath, "data": data} as one line to the queue of the share that holds the
/// full path.
///
/// True when the line is queued, when a reindex of exactly this path is queued already (any event is redundant
/// then), when the queue stayed locked for three attempts (the event is dropped), and when the disk takes the line
/// only in part or not at all (the part is taken back). False when the queue cannot be used: it cannot be opened,
/// is no regular file, has a second name, or its metadata directory is a link. False also for data
/// that no reader accepts: nested deeper than 255 levels, 256 with the line's own, or with an infinite number or
/// NaN. The share is then marked as waiting to be reindexed whole. Sets no code of its own.
FILEINDEX_API bool AddCustomEvent(const int &type, const std::string &fullPath, const Json::Value &data);

/// Sends {"type": command, "data": data} to the daemon on /var/run/fileindexd.sock. True when all of it was
/// handed to the socket; no answer is read. Takes 10 s at most, whatever the daemon does. False, with nothing
/// sent, for data nested deeper than 255 levels or with an infinite number or NaN. Writes no record and sets no
/// code. Ignores SIGPIPE in the whole process from then on.
FILEINDEX_API bool SendCammandToDaemon(const std::string &command, const Json::Value &data);

/// Tells the administrators, through the desktop-notification tool, that a share has no room for index data.
/// True when the tool ran and reported success. Writes no record and sets no code.
FILEINDEX_API bool NotifyNoSpace();

}  // namespace FILEINDEX
}  // namespace VORK

#endif
