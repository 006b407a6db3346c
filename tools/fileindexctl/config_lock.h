/// \file
/// A lock on a configuration file for the length of a scope.
#ifndef FILEINDEXCTL_CONFIG_LOCK_H
#define FILEINDEXCTL_CONFIG_LOCK_H

#include "failure.h"
#include "patience.h"

#include <fileindex/config.h>

namespace fileindexctl {

class ConfigLock {
public:
    /// Throws Failure when this user may not change the configuration.
    ConfigLock(VORK::FILEINDEX::Config &config, Patience &patience) : config_(config) {
        RequireMayChange();
        held_ = config.Lock(true);
        while (!held_ && FailureOf(config_).Status() == ExitStatus::Busy && patience.Again()) {
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

}  // namespace fileindexctl

#endif
