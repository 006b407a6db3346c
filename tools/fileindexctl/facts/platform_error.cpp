#include "facts/platform_error.h"

#include <vork/error.h>

#include <cstdlib>

namespace VORK::FILEINDEXCTL {

namespace {

// Only the file-sharing service is restarted. Its unit has one of two names.
std::string SeeJournal(const std::string &record) {
    const bool isFileSharing = record.find("VLIBServiceRestart") != std::string::npos;
    return std::string("; see \"journalctl -n 20 -u ") + (isFileSharing ? "'smb*'" : "fileindexd") + "\"";
}

}  // namespace

std::string PlatformErrorOf(const std::string &record) {
    static constexpr char kStart[] = "err=[0x";
    const auto start = record.find(kStart);
    if (start == std::string::npos) {
        const bool isOnMonitor = record.find("tifydCfg failed") != std::string::npos;
        return isOnMonitor && VLIBCErrGet() == VORK_ERR_REGISTRATIONS
                   ? "/usr/vork/etc/vorknotifyd/registrations.json is malformed; see \"fileindexctl doctor\""
                   : "";
    }
    switch (std::strtol(record.c_str() + start + sizeof(kStart) - 1, nullptr, 16)) {
        case VORK_ERR_NOT_FOUND:
            return "a file is missing";
        case VORK_ERR_ACCESS:
            return "no permission";
        case VORK_ERR_IO:
            return "reading or writing failed";
        case VORK_ERR_TIMEOUT:
            return "no answer in time";
        case VORK_ERR_MALFORMED:
            return "a settings file is malformed";
        case VORK_ERR_NO_SUCH_SERVICE:
            return "there is no such service";
        case VORK_ERR_SERVICE:
            return "the service reported a failure";
        case VORK_ERR_UNIT_FAILED:
            return "systemd reports a failure" + SeeJournal(record);
        case VORK_ERR_UNIT_MASKED:
            return "its unit is masked; \"systemctl unmask\" allows it";
        case VORK_ERR_UNIT_TIMEOUT:
            return "systemd had not done it after ten seconds" + SeeJournal(record);
        case VORK_ERR_EXEC:
            return "a program could not be run";
        default:
            return {};
    }
}

}  // namespace VORK::FILEINDEXCTL
