/// \file
/// Is a reindex of a path waiting in a queue? One that is still to come makes other events of the path redundant.
#pragma once

#include "base/queue/lines.h"

#include <sys/types.h>

#include <cstddef>
#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace VORK::FILEINDEX::internal {

/// Is a reindex of exactly this path waiting in the file? Several times faster than to look at every line.
bool IsReindexQueued(const std::string &fullPath, const std::string &queueFile);

/// Answers that for the paths of one request with one scan of each queue file.
///
/// Before each answer it reads what was appended since, and starts afresh when the file was consumed or replaced.
/// A line that makes an event redundant is read again before the event is dropped.
class PendingReindexes {
public:
    /// `sharePaths`: the only share paths that may be asked for.
    explicit PendingReindexes(std::vector<std::string> sharePaths);

    /// `sharePath` is the tail of `fullPath`.
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
        std::string last;                                ///< the path of a reindex whose line lacks its newline
    };

    KnownQueue &Queue(const std::string &queueFile, std::string_view volume);

    /// Reads what was appended since the last time. False when the file cannot be read.
    static bool ReadOn(KnownQueue &queue, const std::string &queueFile);

    std::vector<std::string> sharePaths_;
    std::map<std::string, KnownQueue> queues_;
};

}  // namespace VORK::FILEINDEX::internal
