/// \file
/// From the command line to one row of the command table and its arguments.
#ifndef FILEINDEXCTL_PARSER_H
#define FILEINDEXCTL_PARSER_H

#include "command.h"

#include <string>

namespace fileindexctl {

struct Invocation {
    const Command *command = nullptr;  ///< null: nothing to run, only `help` to show
    Arguments arguments;
    bool json = false;
    std::string help;  ///< the help or version text that was asked for
};

/// Throws Failure with ExitStatus::Usage.
Invocation Parse(int argc, const char *const argv[]);

}  // namespace fileindexctl

#endif
