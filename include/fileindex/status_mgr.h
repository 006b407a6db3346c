/// \file
/// Pausing and resuming, per-share flags, and how far indexing has got.
///
/// Every operation is complete in itself: it reads status.conf, and a change is saved before it returns.
/// Changes take the exclusive lock on /tmp/fileidx_cfg_status.lock (FILEINDEX_ERR_LOCK when it is busy) and
/// hold it until the daemon has been told; questions take no lock. Nothing here throws.
#ifndef FILEINDEX_STATUS_MGR_H
#define FILEINDEX_STATUS_MGR_H

#include <fileindex/export.h>

#include <string>

namespace VORK {
namespace FILEINDEX {

/// Results: true on success; the codes of a failure are those of Config (lock, load, save) unless said otherwise.
class StatusMgr {
public:
    /// Pauses indexing for `hours`, without an end when 0, and sends "pause" to the daemon.
    ///
    /// Negative: FILEINDEX_ERR_BAD_PARAM, nothing done. The end is reckoned in 32 bits: one past January 2038
    /// wraps to the past, and the daemon resumes at once. False when the daemon cannot be told; the pause is
    /// saved even so.
    FILEINDEX_API static bool Pause(const int &hours);

    /// Ends a pause and sends "resume" to the daemon. False when it cannot be told; saved even so.
    FILEINDEX_API static bool Resume();

    /// When indexing resumes: seconds since the epoch, 0 for a pause without an end, -1 when not paused.
    FILEINDEX_API static bool GetPauseInfo(long long &resumeTime);

    /// Marks or unmarks a share (its name) as out of space; the first mark notifies the administrators.
    FILEINDEX_API static bool ShareSetNoSpace(const std::string &share, bool noSpace);

    /// Is the share marked? False also when status.conf cannot be read.
    FILEINDEX_API static bool ShareIsNoSpace(const std::string &share);

    /// Unmarks the share and sends "revive_share_worker" to the daemon, whether it was marked or not. False when
    /// the daemon cannot be told, and it is never told a name with a NUL inside; saved even so.
    FILEINDEX_API static bool ShareRevive(const std::string &share);

    /// Marks or unmarks a share as waiting to be reindexed whole.
    FILEINDEX_API static bool ShareSetNeedReindex(const std::string &share, bool needReindex);

    /// Is the share marked? False also when status.conf cannot be read.
    FILEINDEX_API static bool ShareIsNeedReindex(const std::string &share);

    /// Sets a marker of the caller's own; see Status::SetUpdated for the names to avoid.
    FILEINDEX_API static bool SetUpdated(const std::string &key);

    /// Is the marker set? False also when status.conf cannot be read.
    FILEINDEX_API static bool IsUpdated(const std::string &key);

    /// The service as a whole: "processing", "paused" or "finished".
    ///
    /// Inferred from the queue files of the shares that have an indexable folder: a file that exists, even an
    /// empty one, means work left, and only while there is work is a pause shown. False, `status` untouched, when
    /// a configuration file cannot be read, a folder's path is empty or a share's queue cannot be located. Folders
    /// whose share is away do not count.
    FILEINDEX_API static bool GetStatus(std::string &status);

    /// One folder (share path): "finished", "paused", "processing" or "err_no_space".
    ///
    /// Searches the share's whole queue for events at or under the folder. A folder that may not be indexed at
    /// present is "paused", and after any failure the answer is "finished".
    FILEINDEX_API static std::string GetFolderStatus(const std::string &path);
};

}  // namespace FILEINDEX
}  // namespace VORK

#endif
