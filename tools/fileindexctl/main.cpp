#include "failure.h"
#include "output.h"
#include "parser.h"

#include <fileindex/error.h>

#include <cstdio>
#include <exception>
#include <string_view>

namespace {

using fileindexctl::ExitStatus;

// At this level the library also records events that it dropped, which its results do not tell.
constexpr int kLogDroppedEvents = 7;

// A command line that does not parse is reported as JSON too, when it asks for that anywhere.
bool AsksForJson(int argc, const char *const argv[]) {
    for (int i = 1; i < argc; ++i) {
        if (std::string_view(argv[i]) == "--json") {
            return true;
        }
    }
    return false;
}

ExitStatus Run(const fileindexctl::Invocation &invocation, fileindexctl::Output &output) {
    if (invocation.command == nullptr) {
        std::fputs(invocation.help.c_str(), stdout);
        return ExitStatus::Done;
    }
    return invocation.command->run(invocation.arguments, output);
}

}  // namespace

int main(int argc, char *argv[]) {
    using namespace fileindexctl;
    VORK::FILEINDEX::LOG_LEVEL = kLogDroppedEvents;
    try {
        Output output(AsksForJson(argc, argv));
        ExitStatus status = ExitStatus::Done;
        try {
            const Invocation invocation = Parse(argc, argv);
            status = Run(invocation, output);
        } catch (const Failure &failure) {
            status = failure.Status();
            output.Error(status, failure.what());
        }
        return static_cast<int>(output.Finish(status));
    } catch (const std::exception &error) {
        std::fprintf(stderr, "fileindexctl: %s\n", error.what());
        return static_cast<int>(ExitStatus::Partly);
    }
}
