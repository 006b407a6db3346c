/// \file
/// What the scenarios share: checks, figures, processes, and a small machine with two shares.
///
/// A scenario that goes wrong ends its process at once; one that ends, passed.
#pragma once

#include "support/processes.h"

#include <fileindex/fileindex.h>

#include <json/value.h>

#include <sys/mman.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <functional>
#include <new>
#include <optional>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace reliability {

using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every scenario

inline constexpr char kConfigDir[] = "/usr/vork/etc/fileindex";
inline constexpr char kFolderConf[] = "/usr/vork/etc/fileindex/folder.conf";
inline constexpr char kStatusConf[] = "/usr/vork/etc/fileindex/status.conf";
inline constexpr char kFolderLock[] = "/tmp/fileidx_cfg_folder.lock";
inline constexpr char kStatusLock[] = "/tmp/fileidx_cfg_status.lock";
inline constexpr char kQueue[] = "/vol1/photo/@eaDir/VORK@file_index_queue";
inline constexpr char kSocket[] = "/var/run/fileindexd.sock";

// What can be run, "fileindex_torture NAME [ARGUMENT]"; the argument is a file system's or an operation's name.
using Scenario = void(const std::string &argument);
Scenario FullDisk, Cost, Kills, Readers, Adders, Threads, QueueWriters, Moods, WriterModel, Planted, ForeignLocks;
Scenario Operation, ListOperations, AtExit, CancelledThreads;

/// The number of rounds: `whole` when FILEINDEX_TORTURE=long asks for it.
int Rounds(int quick, int whole);

/// Ends the process, with the reason, unless `fine`.
void Check(bool fine, const std::string &reason);

/// Ends the process as a skipped test, with the reason, where the program is built with a sanitizer.
void SkipUnderSanitizers(const std::string &reason);

/// One row of the table that a run ends with: "SUBJECT | what was measured".
[[gnu::format(printf, 1, 2)]] void Figure(const char *format, ...);

/// Seconds, from some beginning.
double Now();

std::optional<std::string> ReadFile(const std::string &path);
void WriteFile(const std::string &path, const std::string &text);
/// Nothing when the text is not JSON from end to end.
std::optional<Json::Value> Parse(const std::string &text);

/// Runs `body` in a process that ends with it, or with the process that started it.
pid_t Start(const std::function<void()> &body);
/// The exit status, or 128 + the signal.
int Wait(pid_t child);
void Kill(pid_t child);

/// Does the call fail and leave the code?
template <typename Call>
bool Fails(Call call, int code) {
    ErrorHandler::SetError(FILEINDEX_ERR_NONE);
    return !call() && ErrorHandler::GetError() == code;
}

/// Fails when the block leaves other descriptors open than it found.
struct SameDescriptors {
    const std::set<std::string> before = fileindex_test::OpenDescriptors();

    ~SameDescriptors() {
        const std::set<std::string> after = fileindex_test::OpenDescriptors();
        std::string left;
        for (const std::string &descriptor : after) {
            left += before.contains(descriptor) ? "" : "; " + descriptor;
        }
        Check(after == before, "other descriptors are open than before" + left);
    }
};

/// An object that the processes started from here share. Never unmapped.
template <typename Object>
Object &Shared() {
    void *memory = ::mmap(nullptr, sizeof(Object), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    Check(memory != MAP_FAILED, "mmap");
    return *new (memory) Object();
}

/// Called in the place of `write` in this process, the library's own calls included; none at first.
std::function<ssize_t(int fd, const void *data, size_t size)> &WriteHook();
ssize_t RealWrite(int fd, const void *data, size_t size);

/// The seconds that the steady clock shows in this process; its own when there is no such function, as at first.
std::function<double()> &ClockHook();

/// Shares photo and music, the services and the notification tool; no configuration, no queue.
void MakeMachine(bool search = true);

/// A daemon that reads every connection to its end.
pid_t StartDaemon();
/// The command socket, listening unless the backlog is negative.
int Listen(int backlog);
sockaddr_un SocketAddress();

Json::Value FolderRequest(const std::string &path, const std::string &name);

template <typename... Elements>
Json::Value Array(const Elements &...elements) {
    Json::Value array(Json::arrayValue);
    (array.append(Json::Value(elements)), ...);
    return array;
}

}  // namespace reliability
