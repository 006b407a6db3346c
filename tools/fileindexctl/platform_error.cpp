#include "platform_error.h"

#include <vork/error.h>

#include <cstdlib>

namespace fileindexctl {

std::string PlatformErrorOf(const std::string &record) {
    static constexpr char kStart[] = "err=[0x";
    const auto start = record.find(kStart);
    if (start == std::string::npos) {
        return {};
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
        case VORK_ERR_EXEC:
            return "a program could not be run";
        default:
            return {};
    }
}

}  // namespace fileindexctl
