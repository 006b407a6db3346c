/// \file
/// A JSON file guarded by a lock file: the base of Folders (folders.h) and Status (status.h).
///
/// An object is a copy of the file for the length of one operation: construct, Lock, Load, change, Save,
/// Unlock. It promises nothing between threads that share it, and it does not follow later changes of the file.
#ifndef FILEINDEX_CONFIG_H
#define FILEINDEX_CONFIG_H

#include <fileindex/export.h>

#include <json/value.h>

#include <string>

namespace VORK {
namespace FILEINDEX {

/// What Folders and Status have in common: a JSON document, its file and the file's lock.
class FILEINDEX_API Config {
public:
    /// An empty JSON object, no lock. Touches no file.
    Config();

    /// Does not release a lock: an object destroyed while it holds one leaves the file locked until the
    /// process ends. Callers pair Lock with Unlock.
    virtual ~Config();

    /// Reads the file into a fresh object (LoadJson) and makes of it what the class holds.
    virtual bool Load() = 0;

    /// Writes what the class holds to the file (SaveJson).
    virtual bool Save() = 0;

    /// The lock file, absolute.
    virtual std::string GetLockPath() const = 0;

    /// The file, absolute.
    virtual std::string GetPath() const = 0;

    /// Takes the advisory lock on GetLockPath(); `exclusive` for writers, shared for readers.
    ///
    /// Never waits in the kernel: three attempts, at most 27 ms of sleep in all. Creates the lock file, which
    /// is never removed. On failure writes one record, sets FILEINDEX_ERR_LOCK and returns false; Unlock may
    /// still follow.
    bool Lock(bool exclusive);

    /// Releases the lock and closes the lock file; nothing if Lock was never called. The stored descriptor is
    /// kept, so call this once for each Lock: a second call would close a descriptor that is no longer ours.
    void Unlock();

    /// Reads GetPath() into the document.
    ///
    /// A missing file is the normal first run: true, and the document stays as it is. So is a symbolic link,
    /// which is never followed. A file that cannot be looked up, read or parsed: one record,
    /// FILEINDEX_ERR_LOAD_JSON, false. Needs no lock: the whole old or the whole new document is read,
    /// whatever a writer is doing.
    bool LoadJson();

    /// Writes the document to GetPath() in place, mode 0644.
    ///
    /// Until it returns true the old file counts: a full disk, a short write or any other error puts the old
    /// bytes back, writes one record, sets FILEINDEX_ERR_SAVE_JSON and returns false. A missing directory is
    /// not created, a symbolic link is not followed. A failing chmod is only logged. Call it with the lock held.
    bool SaveJson();

protected:
    /// The file's whole content.
    Json::Value document_;

    /// When not empty, the JSON text that stands for the content: the document is made from it when it is saved.
    /// Folders reads its file without making one.
    std::string unparsed_;

private:
    Config(const Config &);             // two owners of one lock descriptor would unlock twice
    Config &operator=(const Config &);  // likewise

    int lock_fd_;
};

}  // namespace FILEINDEX
}  // namespace VORK

#endif
