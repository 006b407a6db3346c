/// \file
/// A lock on a configuration file for the length of a scope.
#pragma once

#include "facts/patience.h"
#include "report/failure.h"

#include <fileindex/config.h>

namespace VORK::FILEINDEXCTL {

class ConfigLock {
public:
    /// Throws Failure when this user may not change the configuration.
    ConfigLock(VORK::FILEINDEX::Config &config, Patience &patience) : config_(config) {
        RequireMayChange();
        held_ = config.Lock(true);
        while (!held_ && FailureOf(config_).Status() == ExitStatus::kBusy && patience.Again()) {
            config_.Unlock();
            held_ = config_.Lock(true);
        }
    }
    ~ConfigLock() { config_.Unlock(); }

    ConfigLock(const ConfigLock &) = delete;
    ConfigLock &operator=(const ConfigLock &) = delete;

    bool IsHeld() const { return held_; }

private:
    VORK::FILEINDEX::Config &config_;
    bool held_ = false;
};

}  // namespace VORK::FILEINDEXCTL
