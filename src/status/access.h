/// \file
/// One question of status.conf, or one change of it under its lock.
#pragma once

#include "config/unlocker.h"
#include "no_throw.h"

#include <fileindex/status.h>

namespace VORK::FILEINDEX::internal {

/// Without a lock: a save never shows a reader anything but a whole file.
template <typename Question>
bool AskStatus(Question question) {
    return NoThrow([&] {
        Status status;
        return status.Load() && question(status);
    });
}

/// Lock, load, change, save, tell while the lock is held, unlock. Content of an unexpected type makes the JSON
/// library throw in `change`: then nothing is saved or told.
template <typename Change, typename Tell>
bool ChangeStatus(Change change, Tell tell) {
    return NoThrow([&] {
        Status status;
        const ConfigUnlocker unlocker(status);
        return status.Lock(true) && status.Load() && change(status) && status.Save() && tell();
    });
}

template <typename Change>
bool ChangeStatus(Change change) {
    return ChangeStatus(change, [] { return true; });
}

}  // namespace VORK::FILEINDEX::internal
