// Services by the library's names for them.
#include "common/failure.h"
#include "services/service_manager.h"

#include <vork/error.h>
#include <vork/service.h>

#include <sys/stat.h>

#include <chrono>
#include <exception>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace {

// The callers hold a lock meanwhile.
constexpr std::chrono::seconds kBound{10};

constexpr std::string_view kFileSharing = "samba";

// "samba" itself is the domain controller where it exists, which is another service.
std::vector<std::string> NamesOnThisMachine(std::string_view name) {
    if (name == kFileSharing) {
        return {"smbd", "smb"};
    }
    return {std::string(name)};
}

// A leading "-" would be taken for an option.
bool IsServiceName(const char *name) {
    return name != nullptr && name[0] != '\0' && name[0] != '-' && name[0] != '.' &&
           std::string_view(name).find('/') == std::string_view::npos;
}

std::optional<std::string> FindService(const ServiceManager &manager, const char *name,
                                       ServiceManager::Deadline deadline) {
    for (const std::string &candidate : NamesOnThisMachine(name)) {
        if (manager.Knows(candidate, deadline)) {
            return candidate;
        }
    }
    return std::nullopt;
}

std::unique_ptr<ServiceManager> ManagerOfThisMachine() {
    struct stat status {};
    const bool runsSystemd = stat("/run/systemd/system", &status) == 0 && S_ISDIR(status.st_mode);
    return runsSystemd ? MakeSystemd() : MakeInitScripts();
}

// Runs `act` with the manager and the service's name here, and turns its error into a result.
template <typename Act>
int WithService(const char *name, Act act, Place where = Place::Here()) try {
    if (!IsServiceName(name)) {
        return Fail(VORK_ERR_BAD_PARAMETER, where);
    }
    const auto deadline = std::chrono::steady_clock::now() + kBound;
    const auto manager = ManagerOfThisMachine();
    const std::optional<std::string> service = FindService(*manager, name, deadline);
    if (!service) {
        const bool isLate = std::chrono::steady_clock::now() >= deadline;
        return Fail(isLate ? VORK_ERR_TIMEOUT : VORK_ERR_NO_SUCH_SERVICE, where);
    }
    const int error = act(*manager, *service, deadline);
    return error == 0 ? 0 : Fail(error, where);
} catch (const std::exception &) {
    return Fail(VORK_ERR_SERVICE, where);
}

}  // namespace

int VLIBServiceStart(const char *szName, int flag) {
    return WithService(szName, [flag](const ServiceManager &manager, const std::string &service, auto deadline) {
        const int error = manager.Start(service, deadline);
        return error != 0 || flag != 1 ? error : manager.EnableAtBoot(service, true, deadline);
    });
}

int VLIBServiceStop(const char *szName, int flag) {
    return WithService(szName, [flag](const ServiceManager &manager, const std::string &service, auto deadline) {
        const int error = manager.Stop(service, deadline);
        return error != 0 || flag != 1 ? error : manager.EnableAtBoot(service, false, deadline);
    });
}

int VLIBServiceRestart(const char *szName) {
    return WithService(szName, [szName](const ServiceManager &manager, const std::string &service, auto deadline) {
        return szName == kFileSharing ? manager.RestartIfRunning(service, deadline)
                                      : manager.Restart(service, deadline);
    });
}
