// Measures the rows of the table one after the other and prints the ratios.
//
//   fileindex_bench [--check] [--smoke] [--json FILE] [--only TEXT]
//
// --check exits with 1 when a ratio is missed; --smoke only shows that every row runs. Needs the library's fixed
// paths for itself: run it in a private namespace.

#include "data.h"
#include "measure.h"
#include "queue/pending.h"
#include "rows.h"
#include "rows/support.h"

#include <fileindex/index_mgr.h>

#include <json/value.h>
#include <json/writer.h>

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <exception>
#include <fstream>
#include <string>
#include <vector>

namespace {

struct Options {
    bool check = false;
    bool smoke = false;
    std::string json;
    std::string only;
};

/// The peak memory of a child that runs the operation, in KiB.
template <typename Operation>
long PeakMemory(Operation operation) {
    const pid_t child = fork();
    if (child == 0) {
        operation();
        _exit(0);
    }
    int status = 0;
    rusage usage = {};
    wait4(child, &status, 0, &usage);
    return usage.ru_maxrss;
}

struct Verdict {
    Json::Value rows{Json::arrayValue};
    bool missed = false;

    void Add(const bench::Row &row, const bench::Times &times) {
        const double ofFloor = times.floor > 0 ? times.library / times.floor : 0;
        const double baseline = times.baseline * static_cast<double>(row.baselineParts);
        const double ofBaseline = baseline > 0 ? times.library / baseline : 0;
        const bool slow = (row.mostOfFloor > 0 && ofFloor > row.mostOfFloor) ||
                          (row.mostOfBaseline > 0 && ofBaseline > row.mostOfBaseline);
        missed = missed || slow;
        std::printf("%-62s %12.1f us", row.name.c_str(), times.library * 1e6);
        Print(ofFloor, row.mostOfFloor, "of floor");
        Print(ofBaseline, row.mostOfBaseline, "of baseline");
        std::printf("%s\n", slow ? "  MISSED" : "");
        std::fflush(stdout);
        Json::Value entry(Json::objectValue);
        entry["row"] = row.name;
        entry["library_ns"] = times.library * 1e9;
        entry["baseline_ns"] = baseline * 1e9;
        entry["floor_ns"] = times.floor * 1e9;
        entry["of_floor"] = ofFloor;
        entry["of_baseline"] = ofBaseline;
        entry["missed"] = slow;
        rows.append(entry);
    }

    void AddMemory(const char *name, long kibibytes, long most) {
        missed = missed || kibibytes > most;
        std::printf("%-62s %12ld KiB above idle (at most %ld)%s\n", name, kibibytes, most,
                    kibibytes > most ? "  MISSED" : "");
        Json::Value entry(Json::objectValue);
        entry["row"] = name;
        entry["kib_above_idle"] = static_cast<Json::Int64>(kibibytes);
        rows.append(entry);
    }

private:
    static void Print(double ratio, double most, const char *what) {
        if (ratio == 0) {
            std::printf("  %28s", "");
        } else if (most > 0) {
            std::printf("  %6.4g %-11s (<=%5.3g)", ratio, what, most);
        } else {
            std::printf("  %6.4g %-11s %9s", ratio, what, "");
        }
    }
};

void MeasureMemory(Verdict &verdict, std::size_t scale) {
    const std::string queue = bench::QueuePath("share0");
    bench::WriteQueue(queue, 10);
    bench::WriteFolderConf(bench::SharePaths(1, 1));
    // The code of both has to be in memory in any case.
    const long idle = PeakMemory([&] {
        bench::ReadEvents(queue);
        VORK::FILEINDEX::IndexMgr::IsPathIndexed("/share0/absent");
    });
    bench::WriteQueue(queue, 1000000 / scale);
    const long scan = PeakMemory([&] { bench::ReadEvents(queue); });
    verdict.AddMemory("memory: scan of a queue of 1000000", scan - idle, 512);
    bench::WriteFolderConf(bench::SharePaths(1000, 10));
    const long query = PeakMemory([] { VORK::FILEINDEX::IndexMgr::IsPathIndexed("/share0/absent"); });
    verdict.AddMemory("memory: IsPathIndexed over 1000 folders", query - idle, 4096);
}

/// The pending check as a process of its own, to be compared with grep.
int Find(const char *queue, const char *path) {
    return VORK::FILEINDEX::internal::IsReindexQueued(path, queue) ? 0 : 1;
}

Options Parse(int argc, char **argv) {
    Options options;
    for (int i = 1; i < argc; ++i) {
        const std::string argument = argv[i];
        if (argument == "--check") {
            options.check = true;
        } else if (argument == "--smoke") {
            options.smoke = true;
        } else if (argument == "--json" && i + 1 < argc) {
            options.json = argv[++i];
        } else if (argument == "--only" && i + 1 < argc) {
            options.only = argv[++i];
        } else {
            std::fprintf(stderr, "fileindex_bench: unknown argument %s\n", argv[i]);
            std::exit(64);
        }
    }
    return options;
}

}  // namespace

int main(int argc, char **argv) {
    if (argc == 4 && std::strcmp(argv[1], "--find") == 0) {
        return Find(argv[2], argv[3]);
    }
    const Options options = Parse(argc, argv);
    const std::size_t scale = options.smoke ? 100 : 1;
    std::vector<bench::Row> rows = bench::Rows(scale);
    std::erase_if(rows, [&](const bench::Row &row) { return row.name.find(options.only) == std::string::npos; });

    Verdict verdict;
    bool failed = false;
    for (const bench::Row &row : rows) {
        try {
            verdict.Add(row, bench::Measure(row, options.smoke));
        } catch (const std::exception &failure) {
            std::fprintf(stderr, "%s: %s\n", row.name.c_str(), failure.what());
            failed = true;
        }
    }
    if (options.only.empty()) {
        MeasureMemory(verdict, scale);
    }
    if (!options.json.empty()) {
        std::ofstream(options.json) << verdict.rows << '\n';
    }
    return failed || (options.check && verdict.missed) ? 1 : 0;
}
