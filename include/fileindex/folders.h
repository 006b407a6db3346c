/// \file
/// The store of all indexed folders, /usr/vork/etc/fileindex/folder.conf, guarded by
/// /tmp/fileidx_cfg_folder.lock.
///
/// It changes memory and one file. It tells no daemon: callers that want a change to take effect use
/// IndexMgr (index_mgr.h), which does both.
#ifndef FILEINDEX_FOLDERS_H
#define FILEINDEX_FOLDERS_H

#include <fileindex/config.h>
#include <fileindex/folder.h>

#include <json/value.h>

#include <map>
#include <string>
#include <vector>

namespace VORK {
namespace FILEINDEX {

/// Folders keyed by share path, in byte order. Keys match exactly: "/Music", "/music" and "/music/" are three
/// folders. Not locked by itself: Lock(true) before a change, Unlock after it.
class FILEINDEX_API Folders : public Config {
    friend struct internal::FolderAccess;

public:
    Folders();
    ~Folders() override;

    /// Reads folder.conf into a fresh object. A missing file is an empty list. A record whose share is away is
    /// loaded all the same, without a full path, and FILEINDEX_ERR_PATH is set. Not an object: one record,
    /// FILEINDEX_ERR_MALFORMED_CONFIG, false; unreadable: see Config::LoadJson.
    bool Load() override;

    /// Writes all folders to folder.conf (Config::SaveJson). Only "path", "name" and the four flags survive.
    bool Save() override;

    /// /tmp/fileidx_cfg_folder.lock
    std::string GetLockPath() const override;

    /// /usr/vork/etc/fileindex/folder.conf
    std::string GetPath() const override;

    /// The record stored under exactly `path` (share path). Unknown: one record,
    /// FILEINDEX_ERR_NO_SUCH_FOLDER, false, `out` untouched.
    bool Get(Json::Value &out, const std::string &path);

    /// All folders in byte order of their paths. Always true.
    bool List(std::vector<Folder> &out);

    /// The folders of one share (its exact name), or all when `share` is empty. Always true.
    bool List(std::vector<Folder> &out, const std::string &share);

    /// One page as JSON: {"total": all folders, "offset": as given, "folder": [records with "additional"]}.
    ///
    /// @param out             the page
    /// @param offset          how many folders to leave out; beyond the total, the page is empty
    /// @param limit           how many folders to show at most
    /// @param sort_by         "name", "document", "audio", "video", "photo" (false first); anything else
    ///                        sorts by path. Names and paths are compared without regard to letter case
    /// @param sort_direction  exactly "DESC" gives the first min(total - offset, limit) of the ascending
    ///                        order, reversed, without regard to the offset; anything else ascends
    /// @param additional      keys for Folder::GetAdditional; errors in them do not stop the listing
    /// @return always true
    bool List(Json::Value &out, unsigned long offset, unsigned long limit, const std::string &sort_by,
              const std::string &sort_direction, const Json::Value &additional);

    /// Adds the folder, or changes the members that `folder` holds of one that exists. In memory: Save keeps it.
    ///
    /// @param out     the change report: {"document", "audio", "video", "photo"}, true where what is indexed
    ///                at that path changes
    /// @param folder  a record with at least a string "path" (share path) on an existing share; otherwise
    ///                a record of folders.cpp, FILEINDEX_ERR_BAD_PARAM, false (for an empty path record
    ///                utils.cpp:389 comes first)
    /// @return false also for the 1001st folder, with one record and FILEINDEX_ERR_EXCEED_MAX_FOLDER; this object
    ///         must not be saved any more then
    bool Upsert(Json::Value &out, const Json::Value &folder);

    /// Removes the folder under `path`, if there is one. In memory: Save keeps it.
    ///
    /// @param out   {path: change report}; untouched when the path no longer resolves, which is still true, so
    ///              that folders of a vanished share can be removed
    /// @param path  share path, exactly as stored. One that no longer resolves sets FILEINDEX_ERR_PATH;
    ///              an empty one leaves record utils.cpp:389 and no code
    bool Delete(Json::Value &out, const std::string &path);

private:
    int unresolved_ = 0;  // how many of the folders have no full path
    std::map<std::string, Folder> folders_;
};

/// The record of the folder that governs the full path `path`: of those covering it, the last in the list,
/// even if an earlier one is nearer. An empty object when none does.
FILEINDEX_API Json::Value GetMostSuitableCfg(std::vector<Folder> folders, const std::string &path);

}  // namespace FILEINDEX
}  // namespace VORK

#endif
