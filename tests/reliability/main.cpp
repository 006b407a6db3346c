#include "harness.h"

#include <cstdio>
#include <map>

int main(int count, char **arguments) {
    using namespace reliability;
    const std::map<std::string, Scenario *> scenarios = {
        {"full-disk", FullDisk},
        {"kills", Kills},
        {"cost", Cost},
        {"readers", Readers},
        {"adders", Adders},
        {"threads", Threads},
        {"queue-writers", QueueWriters},
        {"moods", Moods},
        {"writer-model", WriterModel},
        {"planted", Planted},
        {"foreign-locks", ForeignLocks},
        {"operation", Operation},
        {"operations", ListOperations},
        {"at-exit", AtExit},
        {"cancelled-threads", CancelledThreads},
    };
    const auto scenario = scenarios.find(count > 1 ? arguments[1] : "");
    if (scenario == scenarios.end()) {
        std::fprintf(stderr, "usage: fileindex_torture SCENARIO [ARGUMENT]\n");
        return 64;
    }
    scenario->second(count > 2 ? arguments[2] : "");
    return 0;
}
