#include "rows/support.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

namespace bench {

namespace {

std::string Neighbour(const char *program) {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path() / program;
}

void RunProcess(const std::vector<std::string> &arguments, int expected) {
    std::vector<char *> argv;
    argv.reserve(arguments.size() + 1);
    for (const std::string &argument : arguments) {
        argv.push_back(const_cast<char *>(argument.c_str()));
    }
    argv.push_back(nullptr);
    pid_t child = 0;
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    for (const int fd : {STDOUT_FILENO, STDERR_FILENO}) {
        posix_spawn_file_actions_addopen(&actions, fd, "/dev/null", O_WRONLY, 0);
    }
    Require(posix_spawnp(&child, argv[0], &actions, nullptr, argv.data(), environ) == 0, argv[0]);
    posix_spawn_file_actions_destroy(&actions);
    int status = 0;
    waitpid(child, &status, 0);
    Require(WIFEXITED(status) && WEXITSTATUS(status) == expected, argv[0]);
}

Row ProcessFind(std::size_t lines) {
    const std::string queue = QueuePath("share0");
    const std::string path = FullPath(kAbsent);
    Row row;
    row.name = "process: pending-reindex check/" + std::to_string(lines) + " against grep -F";
    row.library = [=] {
        WriteQueue(queue, lines);
        return [=] { RunProcess({"/proc/self/exe", "--find", queue, path}, 1); };
    };
    row.baseline = [=] {
        WriteQueue(queue, lines);
        return [=] { RunProcess({"grep", "-F", path, queue}, 1); };
    };
    row.mostOfBaseline = 1.5;
    return row;
}

/// Against a program in C++ that does nothing: what no program that uses the library can do without.
Row ProcessTool(const char *verb, const std::string &path, int expected) {
    Row row;
    row.name = std::string("process: fileindexctl ") + verb + " against an empty program";
    row.library = [=] {
        WriteFolderConf(SharePaths(10, 1));
        std::filesystem::create_directories(FullPath(path));
        std::ofstream("/usr/vork/etc/platform.conf")
            << R"({"shares":{"share0":{"path":")" << FullPath("/share0") << R"("}}})";
        return [=] { RunProcess({Neighbour("fileindexctl"), verb, path}, expected); };
    };
    row.baseline = [] { return [] { RunProcess({Neighbour("fileindex_bench_empty")}, 0); }; };
    row.mostOfBaseline = 3;
    return row;
}

}  // namespace

std::vector<Row> ProcessRows(std::size_t scale) {
    constexpr int kNo = 1;
    constexpr int kUsage = 64;  // the folder is indexed already: the whole start, and no change
    return {ProcessFind(1000000 / scale), ProcessTool("check", kAbsent, kNo),
            ProcessTool("add", SharePaths(1, 1).front(), kUsage)};
}

}  // namespace bench
