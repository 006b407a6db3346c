#include "base/whole_file.h"

#include "base/flush.h"
#include "base/unique_fd.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <memory>

namespace VORK {

namespace {

constexpr size_t kMaxFileSize = 64U << 20U;

bool WriteAll(int fd, std::string_view text) {
    while (!text.empty()) {
        const ssize_t written = write(fd, text.data(), text.size());
        if (written < 0 && errno != EINTR) {
            return false;
        }
        text.remove_prefix(static_cast<size_t>(std::max<ssize_t>(written, 0)));
    }
    return true;
}

// Where the file really is: replacing a link by a file would part it from the place it was meant to share.
std::string FollowLink(const std::string &path) {
    const std::unique_ptr<char, decltype(&std::free)> real(realpath(path.c_str(), nullptr), &std::free);
    return real == nullptr ? path : std::string(real.get());
}

UniqueFd OpenTemporary(std::string &path, Replacing what) {
    if (what == Replacing::kSettings) {
        return Open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_NOFOLLOW | O_CLOEXEC, 0600);
    }
    const NoCancellation opening;
    UniqueFd file(mkostemp(path.data(), O_CLOEXEC));
    if (!file) {
        path.clear();  // no file has been made
    }
    return file;
}

bool TakeOver(int fd, const std::string &path, mode_t modeIfNew, Replacing what) {
    struct stat old {};
    if (stat(path.c_str(), &old) != 0) {
        return errno == ENOENT && fchmod(fd, modeIfNew) == 0;
    }
    const bool ownerStays = what == Replacing::kSettings;
    return (!ownerStays || fchown(fd, old.st_uid, old.st_gid) == 0) && fchmod(fd, old.st_mode & 07777U) == 0;
}

bool WriteTemporary(std::string &temporary, const std::string &target, std::string_view text, mode_t modeIfNew,
                    Replacing what) {
    UniqueFd file = OpenTemporary(temporary, what);
    return file && WriteAll(file.Get(), text) && TakeOver(file.Get(), target, modeIfNew, what) &&
           Flush(fsync, file.Get()) && file.Close();
}

// Makes the rename itself durable. The new text is in place whatever comes of it.
void SyncDirectoryOf(const std::string &path) {
    const std::string parent = path.substr(0, path.rfind('/') + 1);
    const UniqueFd directory = Open(parent.empty() ? "." : parent.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (directory) {
        (void)Flush(fsync, directory.Get());
    }
}

}  // namespace

std::optional<std::string> ReadAll(int fd) {
    std::string text;
    char chunk[16384];
    for (;;) {
        const ssize_t count = read(fd, chunk, sizeof chunk);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            return std::nullopt;
        }
        if (count == 0) {
            return text;
        }
        if (text.size() + static_cast<size_t>(count) > kMaxFileSize) {
            errno = EFBIG;
            return std::nullopt;
        }
        text.append(chunk, static_cast<size_t>(count));
    }
}

std::optional<std::string> ReadFile(const std::string &path) {
    // Non-blocking, so that a pipe in the file's place holds nobody up.
    const UniqueFd file = Open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (!file) {
        return std::nullopt;
    }
    return ReadAll(file.Get());
}

bool ReplaceFile(const std::string &path, std::string_view text, mode_t modeIfNew, Replacing what) {
    const std::string target = FollowLink(path);
    std::string temporary = target + (what == Replacing::kSettings ? ".tmp" : ".XXXXXX");
    if (WriteTemporary(temporary, target, text, modeIfNew, what) &&
        rename(temporary.c_str(), target.c_str()) == 0) {
        SyncDirectoryOf(target);
        return true;
    }
    const int error = errno;
    unlink(temporary.c_str());
    errno = error;
    return false;
}

}  // namespace VORK
