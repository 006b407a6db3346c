// Services under systemd.
#include "services/programs.h"
#include "services/service_manager.h"

namespace VORK::PLATFORM {

namespace {

class Systemd final : public ServiceManager {
public:
    bool Knows(const std::string &name, Deadline deadline) const override {
        return Run({"cat", Unit(name).c_str()}, deadline) == 0;
    }

    int Start(const std::string &name, Deadline deadline) const override {
        return Run({"start", Unit(name).c_str()}, deadline);
    }

    int Stop(const std::string &name, Deadline deadline) const override {
        return Run({"--no-block", "stop", Unit(name).c_str()}, deadline);
    }

    int RestartIfRunning(const std::string &name, Deadline deadline) const override {
        return Run({"try-restart", Unit(name).c_str()}, deadline);
    }

    int Restart(const std::string &name, Deadline deadline) const override {
        return Run({"restart", Unit(name).c_str()}, deadline);
    }

    // Asked first: changing it makes systemd read all its units again, and fails for good on machines whose
    // /etc is read-only.
    int EnableAtBoot(const std::string &name, bool enable, Deadline deadline) const override {
        const bool enabled = Run({"--quiet", "is-enabled", Unit(name).c_str()}, deadline) == 0;
        if (enabled == enable) {
            return 0;
        }
        return Run({enable ? "enable" : "disable", Unit(name).c_str()}, deadline);
    }

private:
    static std::string Unit(const std::string &name) { return name + ".service"; }

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
