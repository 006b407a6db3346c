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
    /// Never waits in the kernel: three attempts, at most 27 ms of sleep in all. Creates the lock file, mode 0644
    /// less the umask, which is never removed. An attempt fails as well on a lock file that is no regular file,
    /// has lost its name, or belongs to neither root nor the effective user. On failure writes one record, sets
    /// FILEINDEX_ERR_LOCK and returns false; Unlock may still follow.
    bool Lock(bool exclusive);

    /// Releases the lock and closes the lock file; nothing if Lock was never called. The stored descriptor is
    /// kept, so call this once for each Lock: a second call would close a descriptor that is no longer ours.
    void Unlock();

    /// Reads GetPath() into the document.
    ///
    /// A missing file is the normal first run: true, and the document stays as it is. So is a symbolic link, which
    /// is never followed, and anything else that is no regular file. A file that cannot be looked up, read or
    /// parsed: one record, FILEINDEX_ERR_LOAD_JSON, false, and the document is whatever the parser left.
    ///
    /// Needs no lock: the old or the new document is read, whole, while a writer is at work or after one has died.
    /// Reader and writer hold a lock on the file itself for one read or one save, and wait up to 50 ms for it. On
    /// a machine so busy that a writer stands still for longer in the middle of its write, a load that went on
    /// without the lock can fail; the next one does not.
    bool LoadJson();

    /// Writes the document to GetPath() in place, mode 0644. Call it with the lock held.
    ///
    /// True: the document is on the disk, and no power cut takes it away. False: a full disk, a short write or any
    /// other error, or a document that no load would accept (nested deeper than 256 levels, an infinite number,
    /// NaN); the old bytes are put back as far as the system lets us, one record, FILEINDEX_ERR_SAVE_JSON. At
    /// whatever instant the process is killed or the power fails, the file holds the old or the new document. (On
    /// a file system without nameless files the first save can leave it empty.) Until it returns the file may hold
    /// bytes after the document; docs/formats.md describes them.
    ///
    /// Needs room for a second copy meanwhile. Flushes the file three times, so it takes as long as the disk does.
    /// A missing directory is not created, a symbolic link is not followed. A failing chmod leaves one record and
    /// is no failure.
    bool SaveJson();

protected:
    /// The file's whole content, as it was loaded or is to be saved.
    Json::Value document_;

private:
    Config(const Config &);             // two owners of one lock descriptor would unlock twice
    Config &operator=(const Config &);  // likewise

    int lock_fd_;
};

}  // namespace FILEINDEX
}  // namespace VORK

#endif
