// Running programs for the library.
#include "common/failure.h"
#include "process/run_program.h"

#include <vork/error.h>
#include <vork/process.h>

using VORK::PLATFORM::Fail;
using VORK::PLATFORM::RunProgram;
using VORK::PLATFORM::RunResult;

namespace {

int Run(const char *path, const char *const argv[], bool discardOutput) {
    const RunResult result = RunProgram(path, argv, {.discardOutput = discardOutput, .deadline = std::nullopt});
    switch (result.end) {
        case RunResult::End::kExited:
            return result.status;
        case RunResult::End::kUnknownStatus:
            // It ran to its end; calling that a failure would make every call fail in such a host.
            return 0;
        default:
            return Fail(VORK_ERR_EXEC);
    }
}

}  // namespace

int VLIBCExec(const char *szProgram, const char *arg1, const char *arg2, const char *arg3, const char *arg4) {
    const char *const argv[] = {szProgram, arg1, arg2, arg3, arg4, nullptr};
    return VLIBCExecv(szProgram, argv, 0, 0);
}

int VLIBCExecv(const char *szPath, const char *const argv[], int a, int b) {
    if (szPath == nullptr || szPath[0] != '/' || argv == nullptr || argv[0] == nullptr || b != 0) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    return Run(szPath, argv, a == 1);
}
