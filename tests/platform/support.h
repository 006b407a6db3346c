// Files, mounts and child processes for the tests of the platform, which run as root in a file system of their
// own.
#ifndef TESTS_PLATFORM_SUPPORT_H
#define TESTS_PLATFORM_SUPPORT_H

#include <vork/error.h>

#include <gtest/gtest.h>
#include <json/json.h>

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
#include <utility>
#include <vector>

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

/// The JSON example in the platform's README that holds the text.
inline std::string DocumentedExample(const std::string &text) {
    const char *source = std::getenv("SOURCE_DIR");
    const std::string readme = ReadText((source == nullptr ? "." : std::string(source)) + "/platform/README.md");
    const std::string start = "```json\n";
    for (size_t at = readme.find(start); at != std::string::npos; at = readme.find(start, at + 1)) {
        std::string example = readme.substr(at + start.size(), readme.find("```", at + 1) - at - start.size());
        if (example.find(text) != std::string::npos) {
            return example;
        }
    }
    ADD_FAILURE() << "no such example: " << text;
    return "";
}

inline void WriteScript(const std::string &path, const std::string &body) {
    WriteFile(path, "#!/bin/sh\n" + body);
    std::filesystem::permissions(path, std::filesystem::perms(0755));
}

/// Runs a shell command that prepares a test; its exit status.
inline int Shell(const std::string &command) {
    const int status = std::system(command.c_str());
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

inline bool HasProgram(const std::string &name) {
    return Shell("command -v " + name + " >/dev/null") == 0;
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

/// Mounts of one test, taken down again in reverse order.
class Mounts {
public:
    Mounts() = default;
    Mounts(const Mounts &) = delete;
    Mounts &operator=(const Mounts &) = delete;
    ~Mounts() {
        for (auto point = points_.rbegin(); point != points_.rend(); ++point) {
            umount2(point->c_str(), MNT_DETACH);
        }
    }

    bool Mount(const std::string &source, const std::string &point, const std::string &options) {
        if (!std::filesystem::exists(point)) {
            std::filesystem::create_directories(point);
        }
        const bool done = Shell("mount -n " + options + " '" + source + "' '" + point + "' 2>/tmp/mount.err") == 0;
        if (done) {
            points_.push_back(point);
        }
        return done;
    }

    /// Makes an image file with the command, in which $IMAGE stands for it, and mounts it through a loop device.
    bool MountImage(const std::string &image, unsigned int megabytes, const std::string &make,
                    const std::string &point, const std::string &options = "-o loop") {
        std::filesystem::create_directories(std::filesystem::path(image).parent_path());
        return Shell("truncate -s " + std::to_string(megabytes) + "M '" + image + "' && IMAGE='" + image +
                     "' && export IMAGE && { " + make + "; } >/tmp/mkfs.log 2>&1") == 0 &&
               Mount(image, point, options);
    }

private:
    std::vector<std::string> points_;
};

}  // namespace platform_test

#endif
