/// \file
/// What leaves the library for the indexing daemon and the administrators. Most callers want IndexMgr or
/// StatusMgr instead, which save the configuration first.
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
/// only in part or not at all. False when the queue cannot be used; the share is then marked as waiting to be
/// reindexed whole. Sets no code of its own.
FILEINDEX_API bool AddCustomEvent(const int &type, const std::string &fullPath, const Json::Value &data);

/// Sends {"type": command, "data": data} to the daemon on /var/run/fileindexd.sock. True when all of it was
/// handed to the socket; no answer is read. Writes no record and sets no code. Ignores SIGPIPE in the whole
/// process from then on.
FILEINDEX_API bool SendCammandToDaemon(const std::string &command, const Json::Value &data);

/// Tells the administrators, through the desktop-notification tool, that a share has no room for index data.
/// True when the tool ran and reported success. Writes no record and sets no code.
FILEINDEX_API bool NotifyNoSpace();

}  // namespace FILEINDEX
}  // namespace VORK

#endif
