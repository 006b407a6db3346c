/// \file
/// The programs behind the service managers: run quietly, bounded, their ends turned into platform errors.
#pragma once

#include "services/service_manager.h"

#include <initializer_list>
#include <vector>

namespace VORK::PLATFORM {

/// Runs the program with the arguments, its output discarded; 0 or the platform error of its end.
int RunQuietly(const char *program, const std::vector<const char *> &arguments, ServiceManager::Deadline deadline);

/// The first that can be run; the last when none can, so that running it tells.
const char *FirstProgram(std::initializer_list<const char *> candidates);

}  // namespace VORK::PLATFORM
