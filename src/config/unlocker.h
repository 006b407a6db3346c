/// \file
/// A configuration lock that is given up on every way out.
#pragma once

#include "base/cancellation.h"

#include <fileindex/config.h>

namespace VORK::FILEINDEX::internal {

/// Unlocks a configuration on every way out of a manager, exceptions included, whether Lock succeeded or not:
/// a failed Lock leaves its last descriptor to Unlock.
class ConfigUnlocker {
public:
    explicit ConfigUnlocker(Config &config) : config_(config) {}
    ~ConfigUnlocker() {
        const NoCancellation unlocking;
        config_.Unlock();
    }
    ConfigUnlocker(const ConfigUnlocker &) = delete;
    ConfigUnlocker &operator=(const ConfigUnlocker &) = delete;

private:
    Config &config_;
};

}  // namespace VORK::FILEINDEX::internal
