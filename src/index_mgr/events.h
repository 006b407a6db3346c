/// \file
/// The events that tell of a saved change.
#pragma once

#include "records.h"

#include <json/value.h>

#include <string>

namespace VORK::FILEINDEX::internal {

/// The records of one operation for an event that cannot be queued.
struct EventRecords {
    Record path;   ///< its share is unknown
    Record event;  ///< its queue refuses it
};

/// GetFullPath for an event; when the share is unknown, the record and FILEINDEX_ERR_PATH.
bool ResolveForEvent(std::string &fullPath, const std::string &path, const Record &failure);

/// Queues a settings event for each share path of the reports, its member names; stops at the first that fails.
bool QueueReports(const Json::Value &reports, const EventRecords &failures);

}  // namespace VORK::FILEINDEX::internal
