/// \file
/// From the command line to one row of the command table and its arguments.
#pragma once

#include "command_line/command.h"

#include <string>

namespace VORK::FILEINDEXCTL {

struct Invocation {
    const Command *command = nullptr;  ///< null: nothing to run, only `help` to show
    Arguments arguments;
    bool json = false;
    std::string help;  ///< the help or version text that was asked for
};

/// Throws Failure with ExitStatus::kUsage.
Invocation Parse(int argc, const char *const argv[]);

}  // namespace VORK::FILEINDEXCTL
