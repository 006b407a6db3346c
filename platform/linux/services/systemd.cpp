// Services under systemd.
#include "services/programs.h"
#include "services/service_manager.h"

#include <vork/error.h>

#include <unistd.h>

#include <string>
#include <string_view>
#include <vector>

namespace VORK::PLATFORM {

namespace {

constexpr std::string_view kNoUnit = "/dev/null";

// A masked unit is a link to nothing, in the administrator's directory or, until the next boot, in the other.
bool IsMasked(const std::string &unit) {
    for (const char *directory : {"/etc/systemd/system/", "/run/systemd/system/"}) {
        char target[kNoUnit.size() + 1];
        const ssize_t length = readlink((directory + unit).c_str(), target, sizeof target);
        if (length > 0 && std::string_view(target, static_cast<size_t>(length)) == kNoUnit) {
            return true;
        }
    }
    return false;
}

class Systemd final : public ServiceManager {
public:
    bool Knows(const std::string &name, Deadline deadline) const override {
        return IsMasked(Unit(name)) || Run({"cat", Unit(name).c_str()}, deadline) == 0;
    }

    int Start(const std::string &name, Deadline deadline) const override { return Do({"start"}, name, deadline); }

    int Stop(const std::string &name, Deadline deadline) const override {
        return Do({"--no-block", "stop"}, name, deadline);
    }

    int RestartIfRunning(const std::string &name, Deadline deadline) const override {
        return Do({"try-restart"}, name, deadline);
    }

    int Restart(const std::string &name, Deadline deadline) const override {
        return Do({"restart"}, name, deadline);
    }

    // Asked first: changing it makes systemd read all its units again, and fails for good on machines whose
    // /etc is read-only.
    int EnableAtBoot(const std::string &name, bool enable, Deadline deadline) const override {
        const bool enabled = Run({"--quiet", "is-enabled", Unit(name).c_str()}, deadline) == 0;
        if (enabled == enable) {
            return 0;
        }
        return Do({enable ? "enable" : "disable"}, name, deadline);
    }

private:
    static std::string Unit(const std::string &name) { return name + ".service"; }

    // What systemctl says is the error's business to tell where to find.
    static int Do(std::vector<const char *> arguments, const std::string &name, Deadline deadline) {
        const std::string unit = Unit(name);
        arguments.push_back(unit.c_str());
        switch (const int error = Run(arguments, deadline)) {
            case VORK_ERR_SERVICE:
                return IsMasked(unit) ? VORK_ERR_UNIT_MASKED : VORK_ERR_UNIT_FAILED;
            case VORK_ERR_TIMEOUT:
                return VORK_ERR_UNIT_TIMEOUT;
            default:
                return error;
        }
    }

    static int Run(const std::vector<const char *> &arguments, Deadline deadline) {
        std::vector<const char *> all{"--no-ask-password", "--no-pager"};
        all.insert(all.end(), arguments.begin(), arguments.end());
        return RunQuietly(FirstProgram({"/usr/bin/systemctl", "/bin/systemctl"}), all, deadline);
    }
};

}  // namespace

std::unique_ptr<ServiceManager> MakeSystemd() {
    return std::make_unique<Systemd>();
}

}  // namespace VORK::PLATFORM
