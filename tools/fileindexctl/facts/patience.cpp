#include "facts/patience.h"

#include "facts/records.h"
#include "report/failure.h"

#include <algorithm>
#include <csignal>
#include <string>
#include <thread>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr unsigned long kUsual = 5;  // others hold a lock for a change, which seldom takes longer
constexpr unsigned long kLongest = 86400;

bool IsEndHeldBack() {
    sigset_t pending;
    sigpending(&pending);
    return sigismember(&pending, SIGINT) == 1 || sigismember(&pending, SIGTERM) == 1 ||
           sigismember(&pending, SIGHUP) == 1 || sigismember(&pending, SIGQUIT) == 1;
}

}  // namespace

Patience::Patience(const Arguments &arguments) : time_(0) {
    const unsigned long seconds = arguments.Number("--wait", kUsual);
    if (seconds > kLongest) {
        throw Failure(ExitStatus::kUsage, "--wait: 0 to " + std::to_string(kLongest) + " seconds");
    }
    time_ = std::chrono::seconds(seconds);
}

bool Patience::Again() {
    constexpr std::chrono::steady_clock::duration kInterval = std::chrono::milliseconds(100);
    const auto now = std::chrono::steady_clock::now();
    if (!deadline_) {
        deadline_ = now + time_;
    }
    if (now >= *deadline_ || (heedsSignals_ && IsEndHeldBack())) {
        return false;
    }
    Records().TryAgain();
    std::this_thread::sleep_for(std::min(kInterval, *deadline_ - now));
    return true;
}

}  // namespace VORK::FILEINDEXCTL
