// The client class of the notification daemon.
#include "common/failure.h"
#include "notifyd/registrations.h"

#include <vork/error.h>
#include <vorknotifyd/monitor_queue.h>

#include <exception>

namespace VORKNOTIFYD {

using VORK::PLATFORM::Fail;

struct MonitorQueue::Description {
    Json::Value value;
};

MonitorQueue::MonitorQueue(const Json::Value &description) : description_(new Description{description}) {}

MonitorQueue::~MonitorQueue() {
    delete description_;
}

bool MonitorQueue::Upsert(const MonitorQueue &queue, const std::string &name, _tag_monitor_queue_type_ type) try {
    const Json::Value &description = queue.description_->value;
    if (type != MONITOR_QUEUE_TYPE_FILE || name.empty() || !VORK::PLATFORM::IsDescription(description)) {
        Fail(VORK_ERR_BAD_PARAMETER);
        return false;
    }
    return VORK::PLATFORM::StoreRegistration(description, name, type);
} catch (const std::exception &) {
    Fail(VORK_ERR_IO);
    return false;
}

bool MonitorQueue::Delete(const std::string &queuePath, const std::string &name,
                          _tag_monitor_queue_type_ type) try {
    if (type != MONITOR_QUEUE_TYPE_FILE) {
        Fail(VORK_ERR_BAD_PARAMETER);
        return false;
    }
    return VORK::PLATFORM::RemoveRegistration(queuePath, name);
} catch (const std::exception &) {
    Fail(VORK_ERR_IO);
    return false;
}

}  // namespace VORKNOTIFYD
