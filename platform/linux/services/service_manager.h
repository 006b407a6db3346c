/// \file
/// The program that starts and stops services on this machine.
#pragma once

#include <chrono>
#include <memory>
#include <string>

namespace VORK::PLATFORM {

/// Each operation is a number of programs that together end before the deadline. A result is 0 or a platform
/// error.
class ServiceManager {
public:
    using Deadline = std::chrono::steady_clock::time_point;

    ServiceManager() = default;
    ServiceManager(const ServiceManager &) = delete;
    ServiceManager &operator=(const ServiceManager &) = delete;
    virtual ~ServiceManager() = default;

    virtual bool Knows(const std::string &name, Deadline deadline) const = 0;
    virtual int Start(const std::string &name, Deadline deadline) const = 0;
    virtual int Stop(const std::string &name, Deadline deadline) const = 0;
    /// Leaves a service that does not run alone, where the manager can tell.
    virtual int RestartIfRunning(const std::string &name, Deadline deadline) const = 0;
    virtual int Restart(const std::string &name, Deadline deadline) const = 0;
    virtual int EnableAtBoot(const std::string &name, bool enable, Deadline deadline) const = 0;
};

std::unique_ptr<ServiceManager> MakeSystemd();
std::unique_ptr<ServiceManager> MakeInitScripts();

}  // namespace VORK::PLATFORM
