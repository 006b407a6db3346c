/// \file
/// The files of a share's event queue, read as they are at one moment.
///
/// No lock is taken: writers give up on a queue that stays locked, and lose their event.
#ifndef FILEINDEXCTL_QUEUE_FILES_H
#define FILEINDEXCTL_QUEUE_FILES_H

#include "descriptor.h"

#include <json/value.h>

#include <functional>
#include <optional>
#include <string>

namespace fileindexctl {

/// The path of the share's queue; empty when there is no such share.
std::string QueuePathOf(const std::string &share);

struct QueueEvent {
    unsigned type;
    std::string path;
    std::string oldPath;  ///< of a rename
    Json::Value data;
    bool taken;  ///< in the ".tmp" companion: the daemon is at work on it
};

class QueueFiles {
public:
    /// Opens both. Throws Failure when one of them is there and may not be read.
    explicit QueueFiles(const std::string &queuePath);

    bool IsTaken() const { return taken_.birth.has_value(); }

    /// When the older of the files was made, in seconds since the epoch.
    std::optional<long long> Oldest() const;

    /// Tells the queue, or what was taken of it, from every other file, also from one of the same name before or
    /// after it. A queue keeps it when it is taken. Empty for a file that is not there.
    const std::string &Identity(bool taken) const { return (taken ? taken_ : queue_).identity; }

    /// Calls the visitor for each line that was there when the files were opened, the oldest first; with null for
    /// a malformed one. Once.
    void Visit(const std::function<void(const QueueEvent *)> &visitor);

private:
    struct File {
        Descriptor descriptor{};
        long long size = 0;
        std::optional<long long> birth{};
        std::string identity{};
    };
    static File Open(const std::string &path);

    File queue_;
    File taken_;
};

}  // namespace fileindexctl

#endif
