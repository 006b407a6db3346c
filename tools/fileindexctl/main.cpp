#include "command_line/parser.h"
#include "report/failure.h"
#include "report/output.h"
#include "report/text.h"

#include <fileindex/error.h>

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <exception>

namespace {

using namespace VORK::FILEINDEXCTL;

// At this level the library also records events that it dropped, which its results do not tell.
constexpr int kLogDroppedEvents = 7;

// With one of them closed, a configuration file would be opened under its number and take what is printed. What
// stands in for stdout takes nothing, so that the writing fails.
void OpenStandardStreams() {
    for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        if (fcntl(stream, F_GETFD) < 0) {
            open("/dev/null", stream == STDOUT_FILENO ? O_RDONLY : O_RDWR);
        }
    }
}

// A command line that does not parse is reported as JSON too, when it asks for that anywhere.
bool AsksForJson(int argc, const char *const argv[]) {
    return std::find(argv, argv + argc, kJson.name) != argv + argc;
}

ExitStatus Run(const Invocation &invocation, Output &output) {
    if (invocation.command == nullptr) {
        std::fputs(invocation.help.c_str(), stdout);
        return ExitStatus::kDone;
    }
    try {
        return invocation.command->run(invocation.arguments, output);
    } catch (const Failure &failure) {
        output.Error(failure.Status(), failure.what());
        return failure.Status();
    }
}

ExitStatus ParseAndRun(int argc, const char *const argv[]) {
    Invocation invocation;
    try {
        invocation = Parse(argc, argv);
    } catch (const Failure &failure) {
        Output output(AsksForJson(argc, argv));
        output.Error(failure.Status(), failure.what());
        return output.Finish(failure.Status());
    }
    Output output(invocation.json);
    return output.Finish(Run(invocation, output));
}

}  // namespace

int main(int argc, char *argv[]) {
    OpenStandardStreams();
    VORK::FILEINDEX::LOG_LEVEL = kLogDroppedEvents;
    try {
        const ExitStatus status = ParseAndRun(argc, argv);
        ForgetErrors();  // passes on the records that are still held back
        return static_cast<int>(status);
    } catch (const std::exception &error) {
        std::fprintf(stderr, "fileindexctl: %s\n", Printable(error.what()).c_str());
        return static_cast<int>(ExitStatus::kPartly);
    }
}
