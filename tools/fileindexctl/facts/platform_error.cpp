#include "facts/platform_error.h"

#include "base/platform_files.h"

#include <vork/error.h>

#include <algorithm>
#include <cstdlib>
#include <iterator>

namespace VORK::FILEINDEXCTL {

namespace {

struct Error {
    long code;
    const char *words;
    bool isJournaled = false;
};

constexpr Error kErrors[] = {
    {VORK_ERR_NOT_FOUND, "a file is missing"},
    {VORK_ERR_ACCESS, "no permission"},
    {VORK_ERR_IO, "reading or writing failed"},
    {VORK_ERR_TIMEOUT, "no answer in time"},
    {VORK_ERR_MALFORMED, "a settings file is malformed"},
    {VORK_ERR_NO_SUCH_SERVICE, "there is no such service"},
    {VORK_ERR_SERVICE, "the service reported a failure"},
    {VORK_ERR_UNIT_FAILED, "systemd reports a failure", true},
    {VORK_ERR_UNIT_MASKED, "its unit is masked; \"systemctl unmask\" allows it"},
    {VORK_ERR_UNIT_TIMEOUT, "systemd had not done it after ten seconds", true},
    {VORK_ERR_EXEC, "a program could not be run"},
};

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
                   ? std::string(kRegistrationsFile) + " is malformed; see \"fileindexctl doctor\""
                   : "";
    }
    const long code = std::strtol(record.c_str() + start + sizeof(kStart) - 1, nullptr, 16);
    const auto *found = std::find_if(std::begin(kErrors), std::end(kErrors),
                                     [code](const auto &error) { return error.code == code; });
    return found == std::end(kErrors) ? "" : found->words + (found->isJournaled ? SeeJournal(record) : "");
}

}  // namespace VORK::FILEINDEXCTL
