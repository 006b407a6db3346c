// Services by init scripts.
#include "services/programs.h"
#include "services/service_manager.h"

#include <sys/stat.h>
#include <unistd.h>

namespace VORK::PLATFORM {

namespace {

class InitScripts final : public ServiceManager {
public:
    bool Knows(const std::string &name, Deadline) const override {
        struct stat status {};
        const std::string script = "/etc/init.d/" + name;
        return stat(script.c_str(), &status) == 0 && S_ISREG(status.st_mode) && access(script.c_str(), X_OK) == 0;
    }

    int Start(const std::string &name, Deadline deadline) const override { return Do(name, "start", deadline); }
    int Stop(const std::string &name, Deadline deadline) const override { return Do(name, "stop", deadline); }
    int Restart(const std::string &name, Deadline deadline) const override {
        return Do(name, "restart", deadline);
    }

    // Whether a service runs is told too differently by scripts ("status" may be missing) to rely on it.
    int RestartIfRunning(const std::string &name, Deadline deadline) const override {
        return Restart(name, deadline);
    }

    // Turns the links of the script's package on or off. Without such links, or the program, the machine
    // manages its boot in another way, which is no failure of the service.
    int EnableAtBoot(const std::string &name, bool enable, Deadline deadline) const override {
        const char *program = "/usr/sbin/update-rc.d";
        if (access(program, X_OK) == 0) {
            RunQuietly(program, {name.c_str(), enable ? "enable" : "disable"}, deadline);
        }
        return 0;
    }

private:
    static int Do(const std::string &name, const char *action, Deadline deadline) {
        return RunQuietly(FirstProgram({"/usr/sbin/service", "/sbin/service"}), {name.c_str(), action}, deadline);
    }
};

}  // namespace

std::unique_ptr<ServiceManager> MakeInitScripts() {
    return std::make_unique<InitScripts>();
}

}  // namespace VORK::PLATFORM
