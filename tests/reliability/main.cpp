#include "scenarios.h"

#include <cstdio>
#include <functional>
#include <string>

int main(int count, char **arguments) {
    using namespace reliability;
    const std::string argument = count > 2 ? arguments[2] : "";
    const struct {
        const char *name;
        std::function<void()> run;
    } scenarios[] = {
        {"full-disk", [&] { FullDisk(argument); }},
        {"kills", [&] { Kills(argument); }},
        {"readers", Readers},
        {"adders", Adders},
        {"threads", Threads},
        {"queue-writers", QueueWriters},
        {"moods", Moods},
        {"writer-model", WriterModel},
        {"planted", Planted},
        {"foreign-locks", ForeignLocks},
        {"operation", [&] { Operation(argument); }},
        {"operations", ListOperations},
    };
    for (const auto &scenario : scenarios) {
        if (count > 1 && std::string(arguments[1]) == scenario.name) {
            scenario.run();
            return 0;
        }
    }
    std::fprintf(stderr, "usage: fileindex_torture SCENARIO [ARGUMENT]\n");
    return 64;
}
