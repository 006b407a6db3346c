#include "facts/whole_file.h"

#include "base/unique_fd.h"
#include "report/failure.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr std::size_t kLargest = std::size_t{64} << 20;

Failure Trouble(ExitStatus otherwise, const std::string &path, const char *what) {
    const int error = errno;
    const bool denied = error == EACCES || error == EPERM || error == EROFS;
    return {denied ? ExitStatus::kPermission : otherwise, path + " " + what + ": " + std::strerror(error)};
}

// A new file beside the old one, which is gone again unless it takes the old one's place.
class Replacement {
public:
    explicit Replacement(const std::string &target)
        : target_(target), path_(target + ".XXXXXX"), file_(mkostemp(path_.data(), O_CLOEXEC)) {
        if (!file_) {
            path_.clear();
        }
    }
    ~Replacement() {
        if (!path_.empty()) {
            unlink(path_.c_str());
        }
    }
    Replacement(const Replacement &) = delete;
    Replacement &operator=(const Replacement &) = delete;

    bool Take(const std::string &text, mode_t mode) {
        if (!file_ || !Write(text) || fchmod(file_.Get(), mode) != 0 || fsync(file_.Get()) != 0 ||
            !file_.Close() || rename(path_.c_str(), target_.c_str()) != 0) {
            return false;
        }
        path_.clear();
        SyncDirectory();
        return true;
    }

private:
    bool Write(const std::string &text) const {
        for (std::size_t done = 0; done < text.size();) {
            const ssize_t written = write(file_.Get(), text.data() + done, text.size() - done);
            if (written < 0 && errno != EINTR) {
                return false;
            }
            done += written > 0 ? static_cast<std::size_t>(written) : 0;
        }
        return true;
    }

    // So that the name outlasts a loss of power; a file system that cannot do it is none to fail for.
    void SyncDirectory() const {
        const std::string parent = std::filesystem::path(target_).parent_path().string();
        const UniqueFd directory(open(parent.empty() ? "." : parent.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        if (directory) {
            fsync(directory.Get());
        }
    }

    std::string target_;
    std::string path_;
    UniqueFd file_;
};

mode_t DefaultMode() {
    const mode_t mask = umask(0);
    umask(mask);
    return static_cast<mode_t>(0666) & ~mask;
}

}  // namespace

std::string ReadWhole(const std::string &path) {
    const UniqueFd file(path == "-" ? dup(STDIN_FILENO) : open(path.c_str(), O_RDONLY | O_CLOEXEC));
    if (!file) {
        throw Trouble(ExitStatus::kNoSuchFolder, path, "cannot be opened");
    }
    std::string text;
    std::array<char, 1 << 16> buffer{};
    for (;;) {
        const ssize_t count = read(file.Get(), buffer.data(), buffer.size());
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            throw Trouble(ExitStatus::kNoSuchFolder, path, "cannot be read");
        }
        if (count == 0) {
            return text;
        }
        text.append(buffer.data(), static_cast<std::size_t>(count));
        if (text.size() > kLargest) {
            throw Failure(ExitStatus::kMalformed, path + " is too large for a configuration");
        }
    }
}

void WriteWhole(const std::string &path, const std::string &text) {
    std::error_code error;
    struct stat status {};
    const bool exists = stat(path.c_str(), &status) == 0;
    if (exists && !S_ISREG(status.st_mode)) {
        throw Failure(ExitStatus::kUsage, path + " is no ordinary file, and would be replaced by one");
    }
    const std::string target = exists ? std::filesystem::canonical(path, error).string() : path;
    Replacement replacement(target);
    if (!replacement.Take(text, exists ? status.st_mode & 07777 : DefaultMode())) {
        throw Trouble(ExitStatus::kCannotSave, path, "cannot be written");
    }
}

}  // namespace VORK::FILEINDEXCTL
