// Running programs for the library.
#include "common/failure.h"
#include "process/remove.h"
#include "process/run_program.h"

#include <vork/error.h>
#include <vork/process.h>

#include <exception>
#include <string_view>

using VORK::PLATFORM::Fail;
using VORK::PLATFORM::RemoveInShare;
using VORK::PLATFORM::ResultOf;
using VORK::PLATFORM::RunProgram;

int VLIBCExec(const char *szProgram, const char *arg1, const char *arg2, const char *arg3, const char *arg4) try {
    if (szProgram != nullptr && std::string_view(szProgram) == "/bin/rm") {
        return RemoveInShare(arg1, arg3 == nullptr ? arg2 : nullptr);
    }
    const char *const argv[] = {szProgram, arg1, arg2, arg3, arg4, nullptr};
    return VLIBCExecv(szProgram, argv, 0, 0);
} catch (const std::exception &) {
    return Fail(VORK_ERR_EXEC);
}

int VLIBCExecv(const char *szPath, const char *const argv[], int a, int b) {
    if (szPath == nullptr || szPath[0] != '/' || argv == nullptr || argv[0] == nullptr || b != 0) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    return ResultOf(RunProgram(szPath, argv, {.discardOutput = a == 1}));
}
