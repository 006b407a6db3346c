/// \file
/// Files and child processes of the tests that run on the real platform, as root in a file system of their own.
#pragma once

#include <json/reader.h>
#include <json/value.h>

#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <memory>
#include <optional>
#include <string>

namespace machine {

inline constexpr char kPlatformConf[] = "/usr/vork/etc/platform.conf";
inline constexpr char kRegistrations[] = "/usr/vork/etc/vorknotifyd/registrations.json";

/// Ends the process, with the reason, unless `fine`.
inline void Check(bool fine, const std::string &reason) {
    if (!fine) {
        std::fprintf(stderr, "FAILED: %s (errno %s)\n", reason.c_str(), std::strerror(errno));
        ::_exit(1);
    }
}

/// Empty when there is no such file.
inline std::string ReadFile(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

inline void WriteFile(const std::string &path, const std::string &text) {
    std::filesystem::create_directories(std::filesystem::path(path).parent_path());
    Check(static_cast<bool>(std::ofstream(path, std::ios::binary) << text << std::flush), "write " + path);
}

/// Nothing when the text is not JSON from end to end.
inline std::optional<Json::Value> Parse(const std::string &text) {
    Json::CharReaderBuilder builder;
    builder["failIfExtra"] = true;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value value;
    const bool parsed = reader->parse(text.data(), text.data() + text.size(), &value, nullptr);
    return parsed ? std::optional(value) : std::nullopt;
}

/// Runs `body` in a process that ends with it, or with the process that started it.
inline pid_t Start(const std::function<void()> &body) {
    const pid_t parent = ::getpid();
    const pid_t child = ::fork();
    Check(child >= 0, "fork");
    if (child == 0) {
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        if (::getppid() == parent) {
            body();
        }
        ::_exit(0);
    }
    return child;
}

/// The exit status, or 128 + the signal.
inline int Wait(pid_t child) {
    int status = 0;
    Check(::waitpid(child, &status, 0) == child, "waitpid");
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

inline void Kill(pid_t child) {
    ::kill(child, SIGKILL);
    Check(Wait(child) == 128 + SIGKILL, "a process ended before it was killed");
}

}  // namespace machine
