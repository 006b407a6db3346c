/// \file
/// What the scenarios share: checks, figures, processes, and a small machine with two shares.
///
/// A scenario that goes wrong ends its process at once; one that ends, passed.
#pragma once

#include <fileindex/fileindex.h>

#include <json/value.h>

#include <sys/types.h>

#include <chrono>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace reliability {

inline constexpr char kConfigDir[] = "/usr/vork/etc/fileindex";
inline constexpr char kFolderConf[] = "/usr/vork/etc/fileindex/folder.conf";
inline constexpr char kStatusConf[] = "/usr/vork/etc/fileindex/status.conf";
inline constexpr char kFolderLock[] = "/tmp/fileidx_cfg_folder.lock";
inline constexpr char kStatusLock[] = "/tmp/fileidx_cfg_status.lock";
inline constexpr char kQueue[] = "/vol1/photo/@eaDir/VORK@file_index_queue";
inline constexpr char kSocket[] = "/var/run/fileindexd.sock";

/// The number of rounds: `whole` when FILEINDEX_TORTURE=long asks for it.
int Rounds(int quick, int whole);

/// Ends the process, with the reason, unless `fine`.
void Check(bool fine, const std::string &reason);

/// One row of the table that a run ends with.
void Figure(const std::string &subject, const std::string &measured);

std::optional<std::string> ReadFile(const std::string &path);
void WriteFile(const std::string &path, const std::string &text);
/// Nothing when the text is not JSON from end to end.
std::optional<Json::Value> Parse(const std::string &text);

/// Runs `body` in a process that ends with it, or with the process that started it.
pid_t Start(const std::function<void()> &body);
/// The exit status, or 128 + the signal.
int Wait(pid_t child);
void Kill(pid_t child);

/// The code that `operation` leaves; false results only.
template <typename Operation>
bool Fails(Operation operation, int code) {
    namespace fi = VORK::FILEINDEX;
    fi::ErrorHandler::SetError(fi::FILEINDEX_ERR_NONE);
    return !operation() && fi::ErrorHandler::GetError() == code;
}

class Stopwatch {
public:
    double Milliseconds() const {
        return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start_).count();
    }

private:
    std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
};

/// Fails when the block leaves other descriptors open than it found.
class SameDescriptors {
public:
    SameDescriptors();
    ~SameDescriptors();
    SameDescriptors(const SameDescriptors &) = delete;
    SameDescriptors &operator=(const SameDescriptors &) = delete;

private:
    const std::set<std::string> before_;
};

void *SharedMemory(size_t size);

/// An object that the processes started from here share. Never unmapped.
template <typename Object>
Object &Shared() {
    return *new (SharedMemory(sizeof(Object))) Object();
}

/// Called in the place of `write` in this process, the library's own calls included; none at first.
std::function<ssize_t(int fd, const void *data, size_t size)> &WriteHook();
ssize_t RealWrite(int fd, const void *data, size_t size);

/// Shares photo and music, the services and the notification tool; no configuration, no queue.
void MakeMachine(bool search = true);

/// A daemon that reads every connection to its end.
pid_t StartDaemon();
/// The command socket, listening.
int Listen(int backlog);

Json::Value FolderRequest(const std::string &path, const std::string &name);
Json::Value Array(std::initializer_list<Json::Value> elements);

}  // namespace reliability
