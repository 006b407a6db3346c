// Files, child processes and a dead server for the tests of the platform, which run as root in a file system of
// their own.
#ifndef TESTS_PLATFORM_SUPPORT_H
#define TESTS_PLATFORM_SUPPORT_H

#include <vork/error.h>

#include <gtest/gtest.h>
#include <json/json.h>

#include <fcntl.h>
#include <sys/mount.h>
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

/// The mount of a network file system whose server never answers: whoever looks below it waits for ever.
class DeadServer {
public:
    explicit DeadServer(const std::string &point) : point_(point) {
        std::filesystem::create_directories(point);
        const std::string options = "fd=" + std::to_string(fd_) + ",rootmode=40000,user_id=0,group_id=0";
        mounted_ = fd_ >= 0 && mount("server:/", point.c_str(), "fuse.sshfs", 0, options.c_str()) == 0;
    }
    DeadServer(const DeadServer &) = delete;
    DeadServer &operator=(const DeadServer &) = delete;
    ~DeadServer() {
        umount2(point_.c_str(), MNT_DETACH | MNT_FORCE);
        close(fd_);
    }

    /// False where the kernel lacks FUSE.
    bool IsMounted() const { return mounted_; }

private:
    const std::string point_;
    const int fd_ = open("/dev/fuse", O_RDWR | O_CLOEXEC);
    bool mounted_ = false;
};

}  // namespace platform_test

#endif
