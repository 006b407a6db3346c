/// \file
/// Queuing several events in one call: what one of them learned about the queues serves the next.
#pragma once

#include "queue/queue_file.h"

#include <json/value.h>

#include <cstddef>
#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace VORK::FILEINDEX::internal {

/// Answers "is a reindex of this path queued?" for the paths of one request with one scan of each queue file.
///
/// Before each answer it reads what was appended since, and starts afresh when the file was consumed or replaced.
/// A line that makes an event redundant is read again before the event is dropped.
class PendingReindexes {
public:
    /// `sharePaths`: the only share paths that may be asked for.
    explicit PendingReindexes(std::vector<std::string> sharePaths);

    /// Is a reindex of exactly this path waiting in the file? `sharePath` is the tail of `fullPath`.
    bool IsQueued(const std::string &fullPath, const std::string &sharePath, const std::string &queueFile);

private:
    struct Hash {
        using is_transparent = void;
        std::size_t operator()(std::string_view text) const { return std::hash<std::string_view>()(text); }
    };
    using PathSet = std::unordered_set<std::string, Hash, std::equal_to<>>;

    struct KnownQueue {
        QueuePosition position;
        std::string volume;                              ///< what stands before the share path in its full paths
        PathSet wanted;                                  ///< the request's full paths on this volume
        std::unordered_map<std::string, off_t> pending;  ///< those of them found, and where their lines begin
    };

    KnownQueue &Queue(const std::string &queueFile, std::string_view volume);

    std::vector<std::string> sharePaths_;
    std::map<std::string, KnownQueue> queues_;
};

/// Not when those who read the line would refuse it.
bool CanBeQueued(const Json::Value &data);

/// AddCustomEvent for one of several paths of a request; `sharePath` is the tail of `fullPath`.
bool AddEvent(PendingReindexes &pending, int type, const std::string &fullPath, const std::string &sharePath,
              const Json::Value &data);

}  // namespace VORK::FILEINDEX::internal
