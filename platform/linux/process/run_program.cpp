#include "process/run_program.h"

#include "base/cancellation.h"
#include "base/unique_fd.h"
#include "common/failure.h"

#include <vork/error.h>

#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/syscall.h>
#include <sys/wait.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <csignal>

extern char **environ;

namespace VORK::PLATFORM {

namespace {

constexpr int kFirstForeignDescriptor = 3;
constexpr std::chrono::seconds kGrace{1};

class FileActions {
public:
    FileActions() : error_(posix_spawn_file_actions_init(&actions_)) {}
    FileActions(const FileActions &) = delete;
    FileActions &operator=(const FileActions &) = delete;
    ~FileActions() { posix_spawn_file_actions_destroy(&actions_); }

    int Prepare(const RunOptions &options) {
        if (options.directory >= 0) {
            Note(posix_spawn_file_actions_addfchdir_np(&actions_, options.directory));
        }
        // The host's input is not the program's to read.
        Note(posix_spawn_file_actions_addopen(&actions_, STDIN_FILENO, "/dev/null", O_RDONLY, 0));
        for (const int output : {STDOUT_FILENO, STDERR_FILENO}) {
            if (options.discardOutput) {
                Note(posix_spawn_file_actions_addopen(&actions_, output, "/dev/null", O_WRONLY, 0));
            }
        }
        // Ours are close-on-exec, the host's may not be.
        Note(posix_spawn_file_actions_addclosefrom_np(&actions_, kFirstForeignDescriptor));
        return error_;
    }

    const posix_spawn_file_actions_t *Get() const { return &actions_; }

private:
    void Note(int error) { error_ = error_ != 0 ? error_ : error; }

    posix_spawn_file_actions_t actions_{};
    int error_;
};

class Attributes {
public:
    Attributes() : error_(posix_spawnattr_init(&attributes_)) {}
    Attributes(const Attributes &) = delete;
    Attributes &operator=(const Attributes &) = delete;
    ~Attributes() { posix_spawnattr_destroy(&attributes_); }

    int Prepare(bool ownGroup) {
        sigset_t all;
        sigset_t none;
        sigfillset(&all);
        sigemptyset(&none);
        Note(posix_spawnattr_setsigdefault(&attributes_, &all));
        Note(posix_spawnattr_setsigmask(&attributes_, &none));
        short flags = POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK;
        if (ownGroup) {
            flags |= POSIX_SPAWN_SETPGROUP;
        }
        Note(posix_spawnattr_setflags(&attributes_, flags));
        return error_;
    }

    const posix_spawnattr_t *Get() const { return &attributes_; }

private:
    void Note(int error) { error_ = error_ != 0 ? error_ : error; }

    posix_spawnattr_t attributes_{};
    int error_;
};

RunResult Reap(pid_t child) {
    int status = 0;
    while (waitpid(child, &status, 0) < 0) {
        if (errno != EINTR) {
            // A host that ignores SIGCHLD, or waits for any child, leaves nothing to collect.
            return {RunResult::End::kUnknownStatus, 0};
        }
    }
    if (WIFEXITED(status)) {
        return {RunResult::End::kExited, WEXITSTATUS(status)};
    }
    return {RunResult::End::kSignalled, WTERMSIG(status)};
}

// False when the moment passed and the program still runs.
bool EndsBefore(pid_t child, std::chrono::steady_clock::time_point deadline) {
    const UniqueFd handle(static_cast<int>(syscall(SYS_pidfd_open, child, 0U)));
    if (!handle) {
        return errno == ESRCH;
    }
    for (;;) {
        const auto left =
            std::chrono::ceil<std::chrono::milliseconds>(deadline - std::chrono::steady_clock::now());
        const int wait = static_cast<int>(std::clamp<long long>(left.count(), 0, INT_MAX));
        pollfd ended{handle.Get(), POLLIN, 0};
        const int ready = poll(&ended, 1, wait);
        if (ready > 0) {
            return true;
        }
        if (ready == 0 && wait == 0) {
            return false;
        }
        if (ready < 0 && errno != EINTR) {
            return false;
        }
    }
}

}  // namespace

RunResult RunProgram(const char *path, const char *const argv[], const RunOptions &options) {
    const NoCancellation guard;
    FileActions actions;
    Attributes attributes;
    int error = actions.Prepare(options);
    error = error != 0 ? error : attributes.Prepare(options.deadline.has_value());
    if (error != 0) {
        return {RunResult::End::kNotRun, error};
    }
    pid_t child = -1;
    // The vector's type is historical: posix_spawn changes neither the pointers nor the texts.
    error = posix_spawn(&child, path, actions.Get(), attributes.Get(), const_cast<char *const *>(argv), environ);
    if (error != 0) {
        return {RunResult::End::kNotRun, error};
    }
    if (options.deadline && !EndsBefore(child, *options.deadline)) {
        kill(-child, SIGKILL);
        // One that hangs in the kernel is left behind rather than waited for.
        if (EndsBefore(child, std::chrono::steady_clock::now() + kGrace)) {
            Reap(child);
        }
        return {RunResult::End::kOverdue, 0};
    }
    return Reap(child);
}

int ResultOf(const RunResult &result) {
    switch (result.end) {
        case RunResult::End::kExited:
            return result.status;
        case RunResult::End::kUnknownStatus:
            // It ran to its end; calling that a failure would make every call fail in such a host.
            return 0;
        default:
            return Fail(VORK_ERR_EXEC);
    }
}

}  // namespace VORK::PLATFORM
