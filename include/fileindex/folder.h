/// \file
/// One indexed folder: where it is, what it is called, which kinds of file are indexed in it.
///
/// This is the setting, not the state: the daemon follows later. The store of all folders is in folders.h.
#ifndef FILEINDEX_FOLDER_H
#define FILEINDEX_FOLDER_H

#include <fileindex/export.h>

#include <json/value.h>

#include <string>

namespace VORK {
namespace FILEINDEX {

namespace internal {
struct FolderAccess;
}

/// A plain value, copied freely.
class Folder {
    friend struct internal::FolderAccess;

    std::string full_path_;  // empty when `path` could not be resolved

public:
    std::string path;       ///< share path, "/photo/2015"; the folder's identity
    std::string name;       ///< display name
    bool document = false;  ///< index documents
    bool audio = false;     ///< index audio files
    bool video = false;     ///< index video files
    bool photo = false;     ///< index photos

    /// Sets `path` from the argument (never from the record), then each field that `record` holds with the
    /// right type; the others stay as they are. False only when the path cannot be resolved (FILEINDEX_ERR_PATH
    /// and no record; for an empty path no code and record utils.cpp:389); the fields are set all the same.
    FILEINDEX_API bool Load(const std::string &sharePath, const Json::Value &record);

    /// Load into a folder whose fields have first been reset to empty and false.
    FILEINDEX_API bool Reload(const std::string &sharePath, const Json::Value &record);

    /// Moves the folder to another share path and resolves it; the result is that of the resolution.
    FILEINDEX_API bool SetPath(const std::string &sharePath);

    /// The full path: "/vol1/photo/2015" for "/photo/2015" when the share photo is at /vol1/photo.
    ///
    /// One that could not be resolved is tried again at each call. If that fails too, the result is empty, and
    /// there is a record of folder.cpp, with FILEINDEX_ERR_PATH; for an empty path record utils.cpp:389 comes
    /// first, and no code.
    FILEINDEX_API std::string GetFullPath() const;

    /// The record as stored in folder.conf: exactly "path", "name", "document", "audio", "video", "photo".
    FILEINDEX_API Json::Value asJson() const;

    /// The record with one more member, "additional", as GetAdditional fills it from the keys `additional`.
    /// Never fails: bad keys leave the records and the code of GetAdditional, and one record more where it failed.
    FILEINDEX_API Json::Value asJson(const Json::Value &additional) const;

    /// Stores asJson() in `obj` under the name `path`, replacing what was there. False, with nothing changed
    /// or logged, when `obj` is not an object.
    FILEINDEX_API bool AddToJson(Json::Value &obj) const;

    /// One computed fact: "status" (string: "finished", "paused", "processing", "err_no_space") or "is_valid"
    /// (bool: may the path be indexed at present). Any other key: one record, FILEINDEX_ERR_BAD_PARAM, false,
    /// `out` untouched. "status" reads the share's whole queue. Both write the records, and set the codes, of
    /// StatusMgr::GetFolderStatus and CanPathBeIndexed.
    FILEINDEX_API bool GetAdditional(Json::Value &out, const std::string &key) const;

    /// The facts named by the array `keys`, as members of the object `out`. An unknown key stays null, with two
    /// records of folder.cpp and FILEINDEX_ERR_BAD_PARAM, and the result is true all the same. `keys` that is not
    /// an array, or an element that is not a string, ends with one record, the same code and false (facts found
    /// before it stay in `out`).
    FILEINDEX_API bool GetAdditional(Json::Value &out, const Json::Value &keys) const;
};

}  // namespace FILEINDEX
}  // namespace VORK

#endif
