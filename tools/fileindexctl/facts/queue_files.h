/// \file
/// The files of a share's event queue, read as they are at one moment.
///
/// No lock is taken: writers give up on a queue that stays locked, and lose their event.
#pragma once

#include "base/unique_fd.h"

#include <json/value.h>

#include <functional>
#include <optional>
#include <string>

namespace VORK::FILEINDEXCTL {

/// The path of the share's queue; empty when there is no such share. Unlike the library's function of that kind it
/// makes no directory, and writes no record where it may not: who only asks changes nothing.
std::string QueuePathOf(const std::string &share);

/// The library takes a queue that it may not read for none; this tells. One that is not there can be read.
bool IsQueueReadable(const std::string &share);

/// Why no event can be queued for the share, as far as it can be seen; empty otherwise.
std::string TroubleWithQueue(const std::string &share);

struct QueueEvent {
    unsigned type;
    std::string path;
    std::string oldPath;  ///< of a rename
    Json::Value data;
    bool taken;  ///< in the ".tmp" companion
};

class QueueFiles {
public:
    /// Opens both, not through a metadata directory that is a link. Throws Failure when one of them is there and
    /// may not be read.
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

    /// Where the visitor is: in the queue or in what was taken of it, and in which line.
    bool IsAtTaken() const { return atTaken_; }
    unsigned long Line() const { return line_; }

private:
    struct File {
        UniqueFd descriptor{};
        long long size = 0;
        std::optional<long long> birth{};
        std::string identity{};
    };
    static File Open(const UniqueFd &directory, const std::string &path);
    QueueFiles(const UniqueFd &directory, const std::string &queuePath);

    File queue_;
    File taken_;
    bool atTaken_ = false;
    unsigned long line_ = 0;
};

}  // namespace VORK::FILEINDEXCTL
