/// \file
/// How long a command goes on trying to get a lock that another program holds.
#pragma once

#include "command_line/arguments.h"

#include <chrono>
#include <optional>

namespace VORK::FILEINDEXCTL {

class Patience {
public:
    explicit Patience(std::chrono::seconds time = {}) : time_(time) {}

    /// As "--wait" says, 5 s if it is not given. Throws Failure.
    explicit Patience(const Arguments &arguments);

    /// Also ends when a signal that ends programs is held back.
    void HeedHeldSignals() { heedsSignals_ = true; }

    /// Waits a moment before another try, and drops the records that only tell of the last one; false when the
    /// time has passed, which counts from the first call.
    bool Again();

    std::chrono::seconds Time() const { return time_; }

private:
    std::chrono::seconds time_;
    bool heedsSignals_ = false;
    std::optional<std::chrono::steady_clock::time_point> deadline_{};
};

}  // namespace VORK::FILEINDEXCTL
