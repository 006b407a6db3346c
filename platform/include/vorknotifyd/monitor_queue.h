/// \file
/// The client of the notification daemon, which watches directories and writes what changes into queue files.
///
/// A registration is kept durably under the queue's path and a name. The daemon reads all registrations when it
/// starts and notices each change of them. Processes that register at the same time wait for each other, two
/// seconds at most.
#ifndef VORKNOTIFYD_MONITOR_QUEUE_H
#define VORKNOTIFYD_MONITOR_QUEUE_H

#include <json/value.h>

#include <string>

#pragma GCC visibility push(default)
namespace VORKNOTIFYD {

/// What a registration feeds. The library passes the value 1.
enum _tag_monitor_queue_type_ {
    MONITOR_QUEUE_TYPE_NONE = 0,
    MONITOR_QUEUE_TYPE_FILE = 1  ///< a queue file, one JSON record for each line
};

/// The description of one monitored queue: {"queue": queue file, "config": [{"path": full path to watch below,
/// "mask": inotify event bits, "ignore": [names of directories to leave out]}]}.
///
/// The one data member keeps the size fixed, so that another implementation can take this one's place.
class MonitorQueue {
public:
    /// Copies the description. It is checked by Upsert.
    explicit MonitorQueue(const Json::Value &description);
    ~MonitorQueue();

    MonitorQueue(const MonitorQueue &) = delete;
    MonitorQueue &operator=(const MonitorQueue &) = delete;

    /// Creates the registration `name` of the queue, or replaces it whole. False, with the platform error set
    /// and the former registration in place, when the description is malformed or cannot be stored:
    /// VORK_ERR_REGISTRATIONS when the registrations there are cannot be understood, which somebody must set
    /// right.
    static bool Upsert(const MonitorQueue &queue, const std::string &name, _tag_monitor_queue_type_ type);

    /// Withdraws the registration `name` that feeds `queuePath`; one that does not exist counts as withdrawn.
    /// Result as above.
    static bool Delete(const std::string &queuePath, const std::string &name, _tag_monitor_queue_type_ type);

private:
    struct Description;
    Description *description_;
};

}  // namespace VORKNOTIFYD
#pragma GCC visibility pop

#endif
