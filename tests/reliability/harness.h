/// \file
/// What the scenarios share: figures, and a small machine with two shares.
///
/// A scenario that goes wrong ends its process at once; one that ends, passed.
#pragma once

#include "machine.h"
#include "support/processes.h"

#include <fileindex/fileindex.h>

#include <sys/mman.h>

#include <array>
#include <atomic>
#include <new>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace reliability {

using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every scenario
using namespace machine;          // NOLINT(google-build-using-namespace): the tools of every scenario

inline constexpr char kFolderConf[] = "/usr/vork/etc/fileindex/folder.conf";
inline constexpr char kStatusConf[] = "/usr/vork/etc/fileindex/status.conf";
inline constexpr char kFolderLock[] = "/tmp/fileidx_cfg_folder.lock";
inline constexpr char kStatusLock[] = "/tmp/fileidx_cfg_status.lock";
inline constexpr char kQueue[] = "/vol1/photo/@eaDir/VORK@file_index_queue";
inline constexpr char kSocket[] = "/var/run/fileindexd.sock";

// What can be run, "fileindex_torture NAME [ARGUMENT]"; the argument is a file system's or an operation's name.
using Scenario = void(const std::string &argument);
Scenario FullDisk, Writers, Threads, CancelledThreads, QueueWriters, Moods, WriterModel, Operation, ListOperations;
Scenario AtExit;

/// The number of rounds: `whole` when FILEINDEX_TORTURE=long asks for it.
int Rounds(int quick, int whole);

/// One row of the table that a run ends with: "SUBJECT | what was measured".
[[gnu::format(printf, 1, 2)]] void Figure(const char *format, ...);

/// Seconds, from some beginning.
double Now();

/// Fails when the block leaves other descriptors open than it found.
struct SameDescriptors {
    const std::set<std::string> before = fileindex_test::OpenDescriptors();

    ~SameDescriptors() {
        Check(fileindex_test::OpenDescriptors() == before, "other descriptors are open than before");
    }
};

/// An object that the processes started from here share. Never unmapped.
template <typename Object>
Object &Shared() {
    void *memory = ::mmap(nullptr, sizeof(Object), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    Check(memory != MAP_FAILED, "mmap");
    return *new (memory) Object();
}

/// Shares photo and music, the services and the notification tool; no configuration, no queue.
void MakeMachine(bool search = true);

/// The command socket, listening unless the backlog is negative.
int Listen(int backlog);
/// A daemon that reads every connection to its end.
pid_t StartDaemon();

Json::Value FolderRequest(const std::string &path, const std::string &name);

template <typename... Elements>
Json::Value Array(const Elements &...elements) {
    Json::Value array(Json::arrayValue);
    (array.append(Json::Value(elements)), ...);
    return array;
}

}  // namespace reliability
