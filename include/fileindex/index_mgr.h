/// \file
/// The front door: which folders are indexed, adding, changing, removing and reindexing them, and keeping the
/// index in step with shares. Pausing and progress are in status_mgr.h.
///
/// Success means that the configuration is saved and every party has been told, except for what an operation says
/// is only logged; the daemon acts later. Changes are serialised between processes by
/// /tmp/fileidx_cfg_folder.lock, held from the load to the last notification; a call that finds it busy fails with
/// FILEINDEX_ERR_LOCK after at most 27 ms of sleep. Nothing is rolled back: folder.conf is saved before anyone is
/// told, and after a failure the same call repeated tells everyone again (its events then report no change against
/// what was saved: Reindex has the folders read anew). Nothing here throws.
#ifndef FILEINDEX_INDEX_MGR_H
#define FILEINDEX_INDEX_MGR_H

#include <fileindex/export.h>
#include <fileindex/folder.h>

#include <json/value.h>

#include <string>
#include <vector>

namespace VORK {
namespace FILEINDEX {

/// All of it is static: an operation needs no object and leaves none.
class IndexMgr {
public:
    /// \name Questions
    /// Plain byte comparison on component boundaries; nothing is normalised. A trailing "/" of the path
    /// asked for is harmless, except in IsPathContainIndexed, which looks for folders behind it. The
    /// one-argument forms read folder.conf without a lock and answer false when it cannot be read; the others
    /// ask a list that the caller holds (from List).
    /// @{

    /// Does the share path lie at or under an indexed folder? "/photo/2015" covers "/photo/2015/a", not
    /// "/photo/20150".
    FILEINDEX_API static bool IsPathIndexed(const std::string &path);
    /// The same of a list that the caller holds. Reads no file and asks nobody.
    FILEINDEX_API static bool IsPathIndexed(const std::string &path, const std::vector<Folder> &folders);

    /// Does an indexed folder lie at or under the share path?
    FILEINDEX_API static bool IsPathContainIndexed(const std::string &path);
    /// The same of a list that the caller holds.
    FILEINDEX_API static bool IsPathContainIndexed(const std::string &path, const std::vector<Folder> &folders);

    /// Does the full path lie at or under an indexed folder? A folder whose share is away covers nothing.
    FILEINDEX_API static bool IsFullPathIndexed(const std::string &path);
    /// The same of a list that the caller holds; full paths that could not be resolved are tried again.
    FILEINDEX_API static bool IsFullPathIndexed(const std::string &path, const std::vector<Folder> &folders);

    /// Does any indexed folder belong to the share of exactly this name?
    FILEINDEX_API static bool IsShareIndexed(const std::string &share);
    /// @}

    /// \name Lookups
    /// @{

    /// All folders, in byte order of their paths. Reads folder.conf without a lock; false when it cannot be read.
    FILEINDEX_API static bool List(std::vector<Folder> &folders);

    /// One sorted page as JSON; the arguments are those of Folders::List. No lock.
    FILEINDEX_API static bool List(Json::Value &out, unsigned long offset, unsigned long limit,
                                   const std::string &sort_by, const std::string &sort_direction,
                                   const Json::Value &additional);

    /// The record of the folder stored under exactly this share path. Takes the exclusive lock, so it never sees
    /// a change half announced, and fails with FILEINDEX_ERR_LOCK while one is under way. Unknown:
    /// FILEINDEX_ERR_NO_SUCH_FOLDER.
    FILEINDEX_API static bool Get(Json::Value &result, const std::string &path);
    /// @}

    /// \name Changes
    /// @{

    /// Adds folders, or changes the given members of existing ones: all of the batch or none is saved. Takes the
    /// lock.
    ///
    /// `folders` is an array of objects with at least "path" (share path); "name", "document", "audio",
    /// "video" and "photo" as wanted. Then, in this order: the monitor of each share is registered anew, the
    /// daemon is started, the search setting is switched on if it was off (its failure is only logged), the
    /// daemon gets one command for each element, and each path gets one event in its share's queue.
    /// Codes: BAD_PARAM, EXCEED_MAX_FOLDER, LOCK, LOAD_JSON, MALFORMED_CONFIG, SAVE_JSON, PATH; a refusing
    /// daemon, service or monitor sets none, and is in the log.
    FILEINDEX_API static bool Upsert(const Json::Value &folders);
    /// Upsert under another name: it adds as well.
    FILEINDEX_API static bool Set(const Json::Value &folders);
    /// Upsert under another name: it changes as well.
    FILEINDEX_API static bool Add(const Json::Value &folders);

    /// Queues a settings-changed event with the payload `data` for the folder (share path). folder.conf is
    /// neither read nor locked. Unknown share: FILEINDEX_ERR_PATH.
    FILEINDEX_API static bool Update(const std::string &path, const Json::Value &data);

    /// Removes folders: `paths` is an array of share paths; one that is not indexed is no error. Takes the lock. A
    /// share left without folders loses its queue, index database and monitor; when no folder is left anywhere,
    /// the daemon is stopped and the search setting switched off. A folder whose share is gone is removed and
    /// saved, but the call fails where its event cannot be queued or its share not be cleaned. Codes: BAD_PARAM,
    /// LOCK, LOAD_JSON, MALFORMED_CONFIG, SAVE_JSON, PATH; as for Upsert, those who refuse set none.
    FILEINDEX_API static bool Delete(const Json::Value &paths);

    /// Queues a reindex of each share path of the array, whose shares must be indexed, and revives shares that
    /// were out of space. Takes no folder.conf lock. A share that is not indexed: false without a record.
    /// Codes: BAD_PARAM, PATH.
    FILEINDEX_API static bool Reindex(const Json::Value &jsArrPath);
    /// @}

    /// \name File-change monitor
    /// The caller holds the folder.conf lock, or accepts that a writer may overtake it.
    /// @{

    /// Registers the share's folders, as folder.conf holds them now, with the notification daemon, in place of
    /// what was registered before. Sets no code of its own.
    FILEINDEX_API static bool UpsertVorkNotifydCfg(const std::string &share);

    /// Withdraws the share's registration; one that does not exist is no failure. Neither reads nor locks
    /// folder.conf and sets no code of its own.
    FILEINDEX_API static bool DeleteVorkNotifydCfg(const std::string &share);
    /// @}

    /// \name Share lifecycle
    /// Called by share handling. None of them touches status.conf.
    /// @{

    /// Moves the folders of `oldShare` to `newShare`, which exists already, in folder.conf. Nobody is told, and
    /// the monitor keeps its old registration. Both are names of shares, and only folders of exactly `oldShare`
    /// move. Takes the lock. Codes: BAD_PARAM for an unknown new share, LOCK, LOAD_JSON, MALFORMED_CONFIG,
    /// SAVE_JSON.
    FILEINDEX_API static bool ShareRename(const std::string &oldShare, const std::string &newShare);

    /// Removes the folders of the share from folder.conf; when none is left anywhere, stops the daemon and
    /// switches the search setting off (failures there are only logged). Index data, monitor and flags of the
    /// share stay. Takes the lock. Codes: LOCK, LOAD_JSON, MALFORMED_CONFIG, SAVE_JSON.
    FILEINDEX_API static bool ShareRemove(const std::string &share);

    /// Stops the daemon's worker of the share, then its monitor. No lock.
    FILEINDEX_API static bool SharePause(const std::string &share);

    /// Restores the share's monitor, then restarts its worker. No lock.
    FILEINDEX_API static bool ShareResume(const std::string &share);

    /// Deletes the share's queue file, its ".tmp" companion and its index database directory. No lock. The
    /// caller sees to it that the share is not in use. Refused, with nothing deleted, when the share's "@eaDir"
    /// is a link or a path might have been cut.
    FILEINDEX_API static bool CleanShareIndexData(const std::string &share);
    /// @}
};

}  // namespace FILEINDEX
}  // namespace VORK

#endif
