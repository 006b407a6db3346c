/// \file
/// The files of a share's event queue, read as they are at one moment.
#pragma once

#include "base/queue/event.h"

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

class QueueFiles {
public:
    /// Opens both, not through a metadata directory that is a link. Throws Failure when one of them is there and
    /// may not be read.
    explicit QueueFiles(const std::string &queuePath);

    /// Is there a ".tmp" companion, an earlier queue that was taken away?
    bool IsTaken() const { return taken_.birth.has_value(); }

    /// When the older of the files was made, in seconds since the epoch.
    std::optional<long long> Oldest() const;

    /// Calls the visitor for each line that was there when the files were opened, the oldest first; with null for
    /// a malformed one. Once.
    void Visit(const std::function<void(const QueueEvent *)> &visitor);

    /// Where the visitor is: in the queue or in what was taken of it, and in which line.
    bool IsAtTaken() const { return atTaken_; }
    unsigned long Line() const { return line_; }

    /// Tells that file from every other, also from one of the same name before or after it. A queue keeps it when
    /// it is taken.
    const std::string &Identity() const { return (atTaken_ ? taken_ : queue_).identity; }

    /// The "data" of that line.
    Json::Value Data() { return reader_.Data(current_); }

private:
    struct File {
        UniqueFd descriptor{};
        off_t size = 0;
        std::optional<long long> birth{};
        std::string identity{};
    };
    static File Open(const UniqueFd &directory, const std::string &path);
    QueueFiles(const UniqueFd &directory, const std::string &queuePath);

    File queue_;
    File taken_;
    bool atTaken_ = false;
    unsigned long line_ = 0;
    QueueLine current_{};
    QueueEventReader reader_{};
};

}  // namespace VORK::FILEINDEXCTL
