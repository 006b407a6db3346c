/// \file
/// Running one program: spawned without a shell, waited for, bounded when asked to.
#pragma once

#include <chrono>
#include <optional>

namespace VORK::PLATFORM {

struct RunOptions {
    bool discardOutput = false;
    /// The descriptor of its working directory; -1: the caller's own.
    int directory = -1;
    /// The program and all it started in its process group are killed when this moment passes. Without it the
    /// wait is endless, and the program stays in the caller's process group.
    std::optional<std::chrono::steady_clock::time_point> deadline = std::nullopt;
};

struct RunResult {
    enum class End {
        kExited,         ///< `status` is the exit status
        kUnknownStatus,  ///< ran to its end, but the host had its children reaped by others
        kSignalled,
        kOverdue,
        kNotRun  ///< `status` is the errno value
    };
    End end = End::kNotRun;
    int status = 0;
};

/// Runs the program at the absolute path with a null-terminated vector. Standard input is /dev/null. A thread that
/// is cancelled meanwhile ends after the program has: nobody else would collect the child.
RunResult RunProgram(const char *path, const char *const argv[], const RunOptions &options);

/// The result as the C functions give it: the exit status, or negative with the platform error.
int ResultOf(const RunResult &result);

}  // namespace VORK::PLATFORM
