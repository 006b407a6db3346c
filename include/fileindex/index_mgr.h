/// \file
/// The header to open first: which folders are indexed; adding, changing, removing and reindexing them; keeping
/// the index in step with shares. Pausing and progress are in status_mgr.h.
///
/// A change that succeeds is saved, and everybody has been told; each operation says which failures it only logs.
/// The daemon acts later. Changes are serialised between processes by /tmp/fileidx_cfg_folder.lock, held from the
/// load to the last notification; a call that finds it busy fails with FILEINDEX_ERR_LOCK after at most 27 ms of
/// sleep. Nothing is rolled back: folder.conf is saved before anyone is told, and a failed call can be repeated,
/// which tells everyone again. The events of a repeated Upsert report no change, since the first has saved it:
/// call Reindex to have the folders read again. Nothing here throws.
///
/// True does not promise that every event is in its queue. One is dropped, and counts as queued, when the queue
/// stays locked for three attempts, when the disk does not take its line whole, and when a reindex of the same
/// path is queued already, which makes it redundant. The first two leave a record only at LOG_LEVEL 7.
///
/// A request nested deeper than 256 levels of arrays and objects is a bad parameter, and so is one to Upsert with
/// an infinite number or NaN. Its record shows "..." in the place of what is deeper. The value is only looked at;
/// to copy or destroy such a one takes a deep stack, and is the caller's.
#ifndef FILEINDEX_INDEX_MGR_H
#define FILEINDEX_INDEX_MGR_H

#include <fileindex/export.h>
#include <fileindex/folder.h>

#include <json/value.h>

#include <string>
#include <vector>

namespace VORK {
namespace FILEINDEX {

/// All operations are static: no object is needed.
class IndexMgr {
public:
    /// \name Questions
    /// Plain byte comparison on component boundaries; nothing is normalised. A trailing "/" of the path
    /// asked for is harmless, except in IsPathContainIndexed, where "/photo/" does not find "/photo/2015". The
    /// one-argument forms read folder.conf without a lock and answer false when it cannot be read; the others
    /// look into a list that the caller holds (from List).
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
    /// a change half announced, and fails with FILEINDEX_ERR_LOCK while one is under way; so where only root may
    /// open the lock files, as the packages make them, it fails for everybody else. List does not. Unknown:
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
    /// daemon gets one command for each element, and one event for each path is put into its share's queue.
    /// Codes: BAD_PARAM, EXCEED_MAX_FOLDER, LOCK, LOAD_JSON, MALFORMED_CONFIG, SAVE_JSON, PATH. A daemon,
    /// service or monitor that refuses sets none; the log tells.
    FILEINDEX_API static bool Upsert(const Json::Value &folders);
    /// The same as Upsert: it adds folders as well.
    FILEINDEX_API static bool Set(const Json::Value &folders);
    /// The same as Upsert: it changes folders as well.
    FILEINDEX_API static bool Add(const Json::Value &folders);

    /// Queues a settings-changed event with the payload `data` for the folder (share path). folder.conf is
    /// neither read nor locked. Unknown share: FILEINDEX_ERR_PATH. Data that no event can have (see
    /// AddCustomEvent): FILEINDEX_ERR_BAD_PARAM, and the share is marked as waiting to be reindexed whole.
    FILEINDEX_API static bool Update(const std::string &path, const Json::Value &data);

    /// Removes folders: `paths` is an array of share paths; one that is not indexed is no error. Takes the lock. A
    /// share left without folders loses its queue, index database and monitor; when no folder is left anywhere,
    /// the daemon is stopped and the search setting switched off. A folder whose share is gone is removed and
    /// saved, but the call fails where its event cannot be queued or its share not be cleaned. The events of a
    /// repeated call report all kinds as changed, or none where another folder governs the path. Codes: BAD_PARAM,
    /// LOCK, LOAD_JSON, MALFORMED_CONFIG, SAVE_JSON, PATH; those who refuse set none, as with Upsert.
    FILEINDEX_API static bool Delete(const Json::Value &paths);

    /// Queues a reindex of each share path of the array, and revives those of their shares that were out of
    /// space; one that cannot be revived is only logged. Each share must have an indexed folder: otherwise false
    /// without a record of its own. Takes no folder.conf lock. Codes: BAD_PARAM, PATH; LOAD_JSON and
    /// MALFORMED_CONFIG for folder.conf; LOCK, LOAD_JSON and SAVE_JSON for status.conf, where a share is revived,
    /// or marked because its event cannot be queued.
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
    /// move. A folder that `newShare` has already at the same path is overwritten. Takes the lock. Codes:
    /// BAD_PARAM for an unknown new share, LOCK, LOAD_JSON, MALFORMED_CONFIG, SAVE_JSON.
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
    /// caller sees to it that the share is not in use. Refused when a path might have been cut. Whether all is
    /// gone afterwards is not looked at: the platform removes nothing where "@eaDir" is a link.
    FILEINDEX_API static bool CleanShareIndexData(const std::string &share);
    /// @}
};

}  // namespace FILEINDEX
}  // namespace VORK

#endif
