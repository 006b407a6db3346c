/// \file
/// Files and child processes for the tests of the platform, which run as root in a file system of
/// their own.
#pragma once

#include <vork/error.h>
#include <vork/share.h>

#include <gtest/gtest.h>
#include <json/json.h>

#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <sstream>
#include <string>

namespace platform_test {

inline const std::string kConfiguration = "/usr/vork/etc/platform.conf";

inline void WriteFile(const std::string &path, const std::string &text) {
    std::filesystem::create_directories(std::filesystem::path(path).parent_path());
    std::ofstream file(path, std::ios::trunc | std::ios::binary);
    file << text;
    ASSERT_TRUE(file.flush()) << path;
}

inline std::string ReadText(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

inline Json::Value Parse(const std::string &text) {
    Json::Value value;
    std::istringstream(text) >> value;
    return value;
}

/// Runs a shell command that prepares a test; its exit status.
inline int Shell(const std::string &command) {
    const int status = std::system(command.c_str());
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

/// Runs the function in a child process and gives its result as the exit status.
inline pid_t Fork(const std::function<int()> &work) {
    const pid_t child = fork();
    if (child == 0) {
        _exit(work());
    }
    return child;
}

inline int WaitFor(pid_t child) {
    int status = 0;
    return waitpid(child, &status, 0) == child && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

/// "plain", "unlocked", "locked" or "failed".
inline std::string Encryption(const std::string &path) {
    const VORKSHARE share{"share", 0, path.c_str()};
    int kind = -9;
    int locked = -9;
    if (VLIBShareIsEncryptionGet(&share, &kind) < 0 || VLIBShareIsEncryptedGet(&share, &locked) < 0) {
        return "failed";
    }
    return kind == 0 ? "plain" : locked == 1 ? "locked" : "unlocked";
}

}  // namespace platform_test
