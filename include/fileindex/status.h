/// \file
/// The indexing status, /usr/vork/etc/fileindex/status.conf, guarded by /tmp/fileidx_cfg_status.lock: paused
/// until when, which shares are out of space or wait for a reindex, and callers' markers.
///
/// Operations here change memory only. StatusMgr (status_mgr.h) locks, saves and tells the daemon.
#ifndef FILEINDEX_STATUS_H
#define FILEINDEX_STATUS_H

#include <fileindex/config.h>

#include <string>

namespace VORK {
namespace FILEINDEX {

/// Operations on a status.conf whose members have unexpected types let the JSON library's exception pass,
/// except the questions (Is...) and GetPauseInfo, which never throw.
class FILEINDEX_API Status : public Config {
public:
    /// Not paused, nothing marked. Touches no file.
    Status();
    ~Status() override;

    /// Config::LoadJson.
    bool Load() override;

    /// Config::SaveJson. Call it with the lock held.
    bool Save() override;

    /// /tmp/fileidx_cfg_status.lock
    std::string GetLockPath() const override;

    /// /usr/vork/etc/fileindex/status.conf
    std::string GetPath() const override;

    /// `resumeTime`: seconds since the epoch; 0 pauses without an end; -1 means not paused. Always true.
    bool Pause(long long resumeTime);

    /// Not paused any more. Always true.
    bool Resume();

    /// The time given to Pause, -1 when there is none. False, with one record and `resumeTime` unchanged, when
    /// the stored value cannot be read as a number (null reads as 0).
    bool GetPauseInfo(long long &resumeTime);

    /// Marks or unmarks the share (its name) as out of space. The first mark notifies the administrators, once;
    /// a notification that fails is logged and changes nothing. Always true.
    bool ShareSetNoSpace(const std::string &share, bool noSpace);

    /// Only membership counts: a share stored with false is marked all the same.
    bool ShareIsNoSpace(const std::string &share);

    /// Marks or unmarks the share as waiting to be reindexed whole. Always true.
    bool ShareSetNeedReindex(const std::string &share, bool needReindex);

    /// Only membership counts: a share stored with false is marked all the same.
    bool ShareIsNeedReindex(const std::string &share);

    /// Sets the caller's marker, which becomes a member of the file beside its own: so its name must not be
    /// "resume_time", "no_space" or "need_reindex". Always true.
    bool SetUpdated(const std::string &key);

    /// The marker's value, read as a boolean; false when it is absent or cannot be read as one.
    bool IsUpdated(const std::string &key);
};

}  // namespace FILEINDEX
}  // namespace VORK

#endif
