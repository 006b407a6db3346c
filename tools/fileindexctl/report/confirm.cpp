#include "report/confirm.h"

#include "report/failure.h"
#include "report/text.h"

#include <unistd.h>

#include <cstdio>
#include <iostream>

namespace VORK::FILEINDEXCTL {

void RequireConsent(const Arguments &arguments, const std::string &consequence) {
    if (arguments.Has("--yes")) {
        return;
    }
    if (isatty(STDIN_FILENO) == 0 || isatty(STDERR_FILENO) == 0) {
        throw Failure(ExitStatus::kUsage, consequence + "; without a terminal to ask on, --yes is needed");
    }
    std::fprintf(stderr, "fileindexctl: %s. Go on? [y/N] ", Printable(consequence).c_str());
    std::string answer;
    if (!std::getline(std::cin, answer)) {
        std::fputc('\n', stderr);  // nobody typed the end of the line
    }
    if (answer != "y" && answer != "Y" && answer != "yes") {
        throw Failure(ExitStatus::kNo, "nothing was changed");
    }
}

}  // namespace VORK::FILEINDEXCTL
