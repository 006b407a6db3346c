/// \file
/// What waits in a share's event queue, for people and reports. The daemon may take it at any moment.
#pragma once

#include "base/queue/event.h"

#include <json/value.h>

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

struct Backlog {
    std::map<unsigned, unsigned long> events;  ///< number of lines by event type
    unsigned long malformed = 0;
    bool hasTemporary = false;          ///< an earlier queue lies beside it, taken away by the daemon
    std::optional<long long> oldest{};  ///< when the older of the files was made, in seconds since the epoch

    unsigned long taken = 0;  ///< how many of them are in the earlier queue

    /// How many in each file, by its identity (queue_files.h).
    std::map<std::string, unsigned long> files{};

    unsigned long Total() const;
};

/// The share's queue and its ".tmp" companion; only events at or under `below` when that is not empty (a full
/// path). Nothing when there is no such share.
std::optional<Backlog> ReadBacklog(const std::string &share, const std::string &below);

/// The same for several places at once, in the same order. Nothing when there is no such share.
std::vector<Backlog> ReadBacklogs(const std::string &share, const std::vector<std::string> &places);

/// Is a reindex of exactly this full path queued?
bool IsReindexQueued(const std::string &share, const std::string &fullPath);

/// "reindex", "settings", "rename"; for what happened to files otherwise, the number.
std::string EventName(unsigned type);

/// {"total", "events": {"65536": N}, "malformed", "tmp", "oldest"}.
Json::Value BacklogJson(const Backlog &backlog);

/// "3 reindex, 1 settings, 12 files"; "nothing".
std::string BacklogText(const Backlog &backlog);

}  // namespace VORK::FILEINDEXCTL
