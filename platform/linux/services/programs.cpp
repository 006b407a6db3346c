#include "services/programs.h"

#include "process/run_program.h"

#include <vork/error.h>

#include <unistd.h>

namespace VORK::PLATFORM {

namespace {

int ErrorOf(const RunResult &result) {
    switch (result.end) {
        case RunResult::End::kExited:
            return result.status == 0 ? 0 : VORK_ERR_SERVICE;
        case RunResult::End::kUnknownStatus:
            return 0;
        case RunResult::End::kOverdue:
            return VORK_ERR_TIMEOUT;
        case RunResult::End::kNotRun:
            return VORK_ERR_EXEC;
        default:
            return VORK_ERR_SERVICE;
    }
}

}  // namespace

int RunQuietly(const char *program, const std::vector<const char *> &arguments,
               ServiceManager::Deadline deadline) {
    std::vector<const char *> argv{program};
    argv.insert(argv.end(), arguments.begin(), arguments.end());
    argv.push_back(nullptr);
    return ErrorOf(RunProgram(program, argv.data(), {.discardOutput = true, .deadline = deadline}));
}

const char *FirstProgram(std::initializer_list<const char *> candidates) {
    const char *program = nullptr;
    for (const char *candidate : candidates) {
        program = candidate;
        if (access(candidate, X_OK) == 0) {
            break;
        }
    }
    return program;
}

}  // namespace VORK::PLATFORM
