#include "json/file.h"

#include "scoped.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstddef>
#include <thread>

namespace VORK::FILEINDEX::internal {

namespace {

// Non-blocking so that a FIFO planted at the path holds nobody up; it is refused once it is open.
constexpr int kOpenFlags = O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC;

bool IsRegular(int fd, struct stat &status) {
    return fstat(fd, &status) == 0 && S_ISREG(status.st_mode);
}

/// Keeps readers and the writer of one file apart for the moment of the read or write; closing the file ends it.
///
/// Only a courtesy between well-behaved processes: a stranger who sits on the lock delays a call by 50 ms and
/// stops nobody.
bool AwaitDataLock(int fd, int operation) {
    constexpr auto kPatience = std::chrono::milliseconds(50);
    constexpr auto kPause = std::chrono::microseconds(50);
    const auto deadline = std::chrono::steady_clock::now() + kPatience;
    while (flock(fd, operation | LOCK_NB) != 0) {
        const bool busy = errno == EWOULDBLOCK || errno == EINTR;
        if (!busy || std::chrono::steady_clock::now() >= deadline) {
            return false;
        }
        std::this_thread::sleep_for(kPause);
    }
    return true;
}

bool ReadAll(int fd, off_t sizeHint, std::string &out) {
    std::size_t used = 0;
    out.resize(static_cast<std::size_t>(sizeHint) + 1);  // one more, so that the end shows without a second round
    for (;;) {
        const ssize_t count = pread(fd, out.data() + used, out.size() - used, static_cast<off_t>(used));
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            return false;
        }
        if (count == 0) {
            out.resize(used);
            return true;
        }
        used += static_cast<std::size_t>(count);
        if (used == out.size()) {
            out.resize(used * 2);
        }
    }
}

/// Claims the blocks for `size` bytes without changing the file's size, so that a full disk shows before the
/// first old byte is touched. File systems that cannot do this find out in the write, which is undone.
bool Reserve(int fd, std::size_t size) {
    while (fallocate(fd, FALLOC_FL_KEEP_SIZE, 0, static_cast<off_t>(size)) != 0) {
        if (errno == EOPNOTSUPP || errno == ENOSYS) {
            return true;
        }
        if (errno != EINTR) {
            return false;
        }
    }
    return true;
}

bool Truncate(int fd, std::size_t size) {
    return ftruncate(fd, static_cast<off_t>(size)) == 0;
}

/// Puts the old bytes back as far as the system lets us: there is no second way to do it.
void Restore(int fd, const std::string &old) {
    std::size_t done = 0;
    while (done < old.size()) {
        const ssize_t count = pwrite(fd, old.data() + done, old.size() - done, static_cast<off_t>(done));
        if (count <= 0 && !(count < 0 && errno == EINTR)) {
            break;
        }
        done += count > 0 ? static_cast<std::size_t>(count) : 0;
    }
    (void)Truncate(fd, old.size());
}

bool WriteOnce(int fd, const std::string &text) {
    const ssize_t count = write(fd, text.data(), text.size());
    return count >= 0 && static_cast<std::size_t>(count) == text.size();
}

/// Replaces the content of an open file. The text is padded with blanks, which JSON ignores, to the old length,
/// and the length set last: a writer that dies in between leaves a whole document at every instant.
bool Replace(UniqueFd fd, const std::string &path, const std::string &text) {
    struct stat status = {};
    if (!IsRegular(fd.Get(), status)) {
        return false;
    }
    (void)AwaitDataLock(fd.Get(), LOCK_EX);
    std::string old;
    if (!ReadAll(fd.Get(), status.st_size, old)) {
        return false;
    }
    if (text.size() > old.size() && !Reserve(fd.Get(), text.size())) {
        (void)Truncate(fd.Get(), old.size());  // gives back what was claimed before the disk was full
        return false;
    }
    const bool shrinks = text.size() < old.size();
    const bool written = shrinks ? WriteOnce(fd.Get(), text + std::string(old.size() - text.size(), ' ')) &&
                                       Truncate(fd.Get(), text.size())
                                 : WriteOnce(fd.Get(), text);
    if (!written) {
        Restore(fd.Get(), old);
        return false;
    }
    if (!fd.Close()) {
        const UniqueFd again(open(path.c_str(), O_WRONLY | kOpenFlags));
        if (again) {
            Restore(again.Get(), old);
        }
        return false;
    }
    return true;
}

std::string DirectoryOf(const std::string &path) {
    const std::size_t slash = path.rfind('/');
    return slash == std::string::npos ? "." : path.substr(0, slash + 1);
}

/// Gives a nameless file its name. The first way needs a privilege, the second /proc.
bool Publish(int fd, const std::string &path) {
    if (linkat(fd, "", AT_FDCWD, path.c_str(), AT_EMPTY_PATH) == 0) {
        return true;
    }
    const std::string self = "/proc/self/fd/" + std::to_string(fd);
    return linkat(AT_FDCWD, self.c_str(), AT_FDCWD, path.c_str(), AT_SYMLINK_FOLLOW) == 0;
}

/// For file systems without nameless files, or that do not name them later. Here a reader may meet the file empty.
/// One that could not be written goes away again: empty it would be a broken configuration, missing it is none
/// yet.
bool CreateByName(const std::string &path, const std::string &text) {
    UniqueFd fd(open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | kOpenFlags, 0644));
    if (!fd) {
        return false;
    }
    (void)AwaitDataLock(fd.Get(), LOCK_EX);
    if (WriteOnce(fd.Get(), text) && fd.Close()) {
        return true;
    }
    (void)unlink(path.c_str());
    return false;
}

/// Creates the file with its content in one step: it is written without a name and gets the name last, so nobody
/// ever finds it empty or half written, and a writer that dies leaves nothing behind.
bool Create(const std::string &path, const std::string &text) {
    UniqueFd fd(open(DirectoryOf(path).c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0644));
    if (!fd) {
        const bool unsupported = errno == EOPNOTSUPP || errno == EISDIR || errno == EINVAL;
        return unsupported && CreateByName(path, text);
    }
    // Readers of other users must not be shut out by the umask between the name and the caller's chmod.
    if (!WriteOnce(fd.Get(), text) || fchmod(fd.Get(), 0644) != 0) {
        return false;
    }
    if (!Publish(fd.Get(), path)) {
        return errno != EEXIST && CreateByName(path, text);
    }
    if (!fd.Close()) {
        (void)unlink(path.c_str());
        return false;
    }
    return true;
}

}  // namespace

bool ReadFile(const std::string &path, std::string &text, bool &undisturbed) {
    const UniqueFd fd(open(path.c_str(), O_RDONLY | kOpenFlags));
    struct stat status = {};
    if (!fd || !IsRegular(fd.Get(), status)) {
        return false;
    }
    undisturbed = AwaitDataLock(fd.Get(), LOCK_SH);
    if (!ReadAll(fd.Get(), status.st_size, text)) {
        return false;
    }
    if (!undisturbed) {
        std::string again;
        undisturbed = ReadAll(fd.Get(), status.st_size, again) && again == text;
    }
    return true;
}

bool WriteFile(const std::string &path, const std::string &text) {
    UniqueFd fd(open(path.c_str(), O_RDWR | kOpenFlags));
    if (!fd && errno == ENOENT) {
        if (Create(path, text)) {
            return true;
        }
        fd = UniqueFd(open(path.c_str(), O_RDWR | kOpenFlags));  // another writer may have made it meanwhile
    }
    return fd && Replace(std::move(fd), path, text);
}

}  // namespace VORK::FILEINDEX::internal
