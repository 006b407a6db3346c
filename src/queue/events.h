/// \file
/// Queuing several events in one call. What the question about one of them showed of a queue serves the next.
#pragma once

#include "base/queue/event.h"
#include "queue/pending.h"

#include <json/value.h>

#include <string>

namespace VORK::FILEINDEX::internal {

/// Not when those who read the line would refuse it.
bool CanBeQueued(const Json::Value &data);

/// AddCustomEvent for one of several paths of a request; `sharePath` is the tail of `fullPath`.
bool AddEvent(PendingReindexes &pending, int type, const std::string &fullPath, const std::string &sharePath,
              const Json::Value &data);

}  // namespace VORK::FILEINDEX::internal
