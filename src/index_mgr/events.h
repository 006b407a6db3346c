/// \file
/// The events that follow a saved change, each queued for one of several paths of a request.
#pragma once

#include "queue/events.h"

#include <json/value.h>

#include <string>

namespace VORK::FILEINDEX::internal {

/// The share paths of a change map: its member names.
PendingReindexes PendingReindexesOf(const Json::Value &reports);

/// IndexMgr::Update for one of several paths.
bool UpdateOne(PendingReindexes &pending, const std::string &path, const Json::Value &data);

}  // namespace VORK::FILEINDEX::internal
