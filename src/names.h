/// \file
/// Fixed paths, keys, limits and codes that other programs know as well. What only one function needs, such as the
/// arguments of the notification tool, is in that function.
#pragma once

#include <cstddef>

namespace VORK::FILEINDEX::internal {

// Configuration files.
inline constexpr char kFolderConf[] = "/usr/vork/etc/fileindex/folder.conf";
inline constexpr char kFolderLock[] = "/tmp/fileidx_cfg_folder.lock";
inline constexpr char kStatusConf[] = "/usr/vork/etc/fileindex/status.conf";
inline constexpr char kStatusLock[] = "/tmp/fileidx_cfg_status.lock";
inline constexpr std::size_t kMaxFolders = 1000;

// Members of a folder record.
inline constexpr char kPathKey[] = "path";
inline constexpr char kNameKey[] = "name";

// Members of status.conf.
inline constexpr char kResumeTimeKey[] = "resume_time";
inline constexpr char kNoSpaceKey[] = "no_space";
inline constexpr char kNeedReindexKey[] = "need_reindex";

// Index data inside a share's directory.
inline constexpr char kMetadataDir[] = "@eaDir";
inline constexpr char kQueueFile[] = "VORK@file_index_queue";
inline constexpr char kDatabaseDir[] = "VORK@.fileindexdb";
inline constexpr char kQueueTmpSuffix[] = ".tmp";

// The daemon, its socket and its commands.
inline constexpr char kDaemonSocket[] = "/var/run/fileindexd.sock";
inline constexpr char kDaemonService[] = "fileindexd";
inline constexpr char kFileSharingService[] = "samba";
inline constexpr char kUpsertCommand[] = "upsert_folder_setting";
inline constexpr char kDeleteCommand[] = "delete_folder_setting";
inline constexpr char kPauseCommand[] = "pause";
inline constexpr char kResumeCommand[] = "resume";
inline constexpr char kReviveShareCommand[] = "revive_share_worker";
inline constexpr char kDeleteShareCommand[] = "delete_share_worker";
inline constexpr char kFolderPathKey[] = "folder_path";
inline constexpr char kShareNameKey[] = "share_name";

// The notification daemon's registration.
inline constexpr char kMonitorName[] = "fileindex";
inline constexpr int kMonitorMask = 0xFFCE;  // every change and move; not access, close without write, open

// Buffers of the platform's share library.
inline constexpr int kShareNameSize = 492;
inline constexpr int kPathSize = 4096;

inline constexpr int kDebugLevel = 7;

}  // namespace VORK::FILEINDEX::internal
