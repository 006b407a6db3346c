#include "base/whole_file.h"

#include "base/unique_fd.h"

#include <cerrno>

namespace VORK {

namespace {

constexpr size_t kMaxFileSize = 64U << 20U;

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

}  // namespace VORK
