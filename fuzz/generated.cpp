// Generates texts that are JSON or nearly so: to check them at once, or as the seeds of the fuzz targets.
//
//   fuzz_generated check COUNT [SEED]    COUNT lines, folder files and documents, and some queues
//   fuzz_generated seeds DIR             files below DIR/TARGET, and the dictionary DIR/dictionary

#include "json_checks.h"
#include "near_valid.h"
#include "queue_checks.h"
#include "support.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

namespace {

using namespace fileindex_fuzz;  // NOLINT(google-build-using-namespace): this is their program

/// Queues with a line of just about the sizes at which the reader's buffer ends, and the longest line.
void CheckLongLines() {
    const std::string around = "{\"event\":256,\"path\":\"/a\"}\n";
    for (const std::size_t about : {64UL * 1024, 128UL * 1024, 1024UL * 1024, 1088UL * 1024}) {
        for (const std::size_t size : {about - 1, about, about + 1}) {
            std::string line = R"({"event":65536,"path":"/vol1/a/d","data":")";
            line.resize(size - 2, 'x');
            line += "\"}";
            CheckQueue(line, about / 2);
            CheckQueue(line + '\n', about);
            CheckQueue(std::string(around).append(line).append("\n").append(around), around.size() + about / 2);
        }
    }
}

int Check(unsigned long count, unsigned long seed) {
    constexpr unsigned kTextsOfARound = 3;
    const unsigned long rounds = count / kTextsOfARound;
    CheckLongLines();
    unsigned long events = 0;
    unsigned long folders = 0;
    unsigned long documents = 0;
    for (unsigned long i = 0; i < rounds; ++i) {
        NearValid next(seed + i);
        events += CheckEvent(next.QueueLine()) ? 1 : 0;
        folders += CheckFolders(next.FolderConf()) ? 1 : 0;
        documents += CheckWriter(next.Document()) ? 1 : 0;
        if (i % 10 == 0) {
            const std::string queue = next.Queue();
            CheckQueue(queue, next.Below(queue.size() + 1));
        }
    }
    std::printf("%lu texts: the fast reader decided %lu lines and %lu folder files; %lu documents were written\n",
                count, events, folders, documents);
    // A comparison that hardly ever takes place shows nothing.
    const unsigned long enough = rounds / 10;
    Require(events > enough && folders > enough && documents > enough, "too little was compared");
    return 0;
}

int Seeds(const std::string &dir) {
    using Make = std::string (NearValid::*)();
    const struct {
        const char *target;
        Make make;
    } rows[] = {
        {"json_differential", &NearValid::QueueLine},
        {"json_differential", &NearValid::FolderConf},
        {"json_differential", &NearValid::Document},
        {"queue_file", &NearValid::Queue},
        {"folder_conf", &NearValid::FolderConf},
        {"status_conf", &NearValid::Document},
        {"requests", &NearValid::FolderConf},
        {"paths", &NearValid::QueueLine},
        {"operations", &NearValid::Queue},
    };
    constexpr unsigned kSeeds = 40;
    unsigned number = 0;
    for (const auto &row : rows) {
        const std::filesystem::path corpus = std::filesystem::path(dir) / row.target;
        std::filesystem::create_directories(corpus);
        for (unsigned i = 0; i < kSeeds; ++i, ++number) {
            NearValid next(number);
            std::ofstream(corpus / ("seed" + std::to_string(number)), std::ios::binary) << (next.*row.make)();
        }
    }
    std::ofstream dictionary(dir + "/dictionary");
    for (const char *word : {"event", "path", "path_old", "data", "name", "document", "audio", "video", "photo",
                             "resume_time", "no_space", "need_reindex"}) {
        dictionary << "\"\\\"" << word << "\\\":\"\n";
    }
    for (const char *word :
         {"/photo", "/a/d", "/b", "/ro", "/away", "/vol1/a", "@eaDir", "/vol1/a/#recycle", "/vol1/a/#snapshot",
          "65536", "true", "false", "null", "\\\\ud83d", "\\xef\\xbb\\xbf"}) {
        dictionary << '"' << word << "\"\n";
    }
    return dictionary.good() ? 0 : 1;
}

}  // namespace

int main(int argc, char **argv) {
    const std::string mode = argc >= 3 ? argv[1] : "";
    if (mode == "check") {
        return Check(std::strtoul(argv[2], nullptr, 10), argc > 3 ? std::strtoul(argv[3], nullptr, 10) : 1);
    }
    if (mode == "seeds") {
        return Seeds(argv[2]);
    }
    std::fputs("usage: fuzz_generated check COUNT [SEED] | seeds DIR\n", stderr);
    return 2;
}
