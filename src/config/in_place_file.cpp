#include "config/in_place_file.h"

#include "base/flush.h"
#include "base/unique_fd.h"
#include "config/tail.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstddef>
#include <string_view>
#include <thread>

namespace VORK::FILEINDEX::internal {

namespace {

// Non-blocking so that a FIFO planted at the path holds nobody up; it is refused once it is open.
constexpr int kOpenFlags = O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC;

// A file system that is always interrupted must not hold a caller for ever.
constexpr int kMaxInterruptions = 100;

bool IsRegular(int fd, struct stat &status) {
    return fstat(fd, &status) == 0 && S_ISREG(status.st_mode);
}

/// Keeps readers and the writer of one file apart for one read or one save; closing the file ends it.
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

/// The bytes of a file whose size may change meanwhile.
bool ReadAll(int fd, off_t sizeHint, std::string &out) {
    std::size_t used = 0;
    int interruptions = 0;
    out.resize(static_cast<std::size_t>(sizeHint) + 1);  // one more, so that the end shows without a second round
    for (;;) {
        const ssize_t count = pread(fd, out.data() + used, out.size() - used, static_cast<off_t>(used));
        if (count < 0 && errno == EINTR && ++interruptions < kMaxInterruptions) {
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

bool FlushData(int fd) {
    return Flush(fdatasync, fd);
}

bool WriteOnce(int fd, std::string_view bytes, std::size_t offset) {
    if (lseek(fd, static_cast<off_t>(offset), SEEK_SET) < 0) {
        return false;
    }
    const ssize_t count = write(fd, bytes.data(), bytes.size());
    return count >= 0 && static_cast<std::size_t>(count) == bytes.size();
}

/// Sets the file's length, on the disk too: nothing of this tail may be left under the next one.
bool CutTo(int fd, std::size_t size) {
    return ftruncate(fd, static_cast<off_t>(size)) == 0 && FlushData(fd);
}

/// Ends a save that a tail has made safe: a crash from here on leaves the tail's document.
bool WriteHead(int fd, std::string_view document) {
    return WriteOnce(fd, document, 0) && FlushData(fd);
}

bool WriteInPieces(int fd, std::string_view bytes) {
    std::size_t done = 0;
    int interruptions = 0;
    while (done < bytes.size()) {
        const ssize_t count = pwrite(fd, bytes.data() + done, bytes.size() - done, static_cast<off_t>(done));
        const bool interrupted = count < 0 && errno == EINTR && ++interruptions < kMaxInterruptions;
        if (count <= 0 && !interrupted) {
            return false;
        }
        done += count > 0 ? static_cast<std::size_t>(count) : 0;
    }
    return true;
}

/// Where even the old bytes cannot be written, the tail stays: it holds the only whole document.
void PutBack(int fd, std::string_view old) {
    if (WriteInPieces(fd, old)) {
        (void)FlushData(fd);
        (void)CutTo(fd, old.size());
    }
}

/// Does what a writer that died has left to do.
bool PutInOrder(int fd, const FileContent &content) {
    switch (content.state) {
        case FileState::kPlain:
            return true;
        case FileState::kWholeTail:
            return WriteHead(fd, content.document) && CutTo(fd, content.document.size());
        case FileState::kTorn:
            return CutTo(fd, content.document.size());
    }
    return false;
}

/// Replaces the content of an open file: the tail first, then the head, then the tail goes. Each of these is on
/// the disk before the next begins.
bool Replace(const UniqueFd &fd, const std::string &text) {
    struct stat status = {};
    if (!IsRegular(fd.Get(), status)) {
        return false;
    }
    (void)AwaitDataLock(fd.Get(), LOCK_EX);
    std::string bytes;
    if (!ReadAll(fd.Get(), status.st_size, bytes)) {
        return false;
    }
    const FileContent content = ContentOf(bytes);
    if (!PutInOrder(fd.Get(), content)) {
        return false;
    }
    const std::string_view old = content.document;
    // A full disk shows here, before the first old byte is touched.
    if (!WriteOnce(fd.Get(), TailAfter(old.size(), text), old.size()) || !FlushData(fd.Get())) {
        (void)CutTo(fd.Get(), old.size());
        return false;
    }
    if (!WriteHead(fd.Get(), text)) {
        PutBack(fd.Get(), old);
        return false;
    }
    (void)CutTo(fd.Get(), text.size());  // a tail that stays says the same, and the next save cuts it off
    return true;
}

std::string DirectoryOf(const std::string &path) {
    const std::size_t slash = path.rfind('/');
    return slash == std::string::npos ? "." : path.substr(0, slash + 1);
}

bool FlushNames(const std::string &directory) {
    const UniqueFd fd = Open(directory.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    return fd && Flush(fsync, fd.Get());
}

/// Fills a new file. Readers of other users must not be shut out by the umask before the caller sets the mode;
/// where the mode cannot be set here, the caller's attempt has the record.
bool Fill(int fd, const std::string &text) {
    (void)fchmod(fd, 0644);
    return WriteOnce(fd, text, 0) && Flush(fsync, fd);
}

/// Gives a nameless file its name. The first way needs a privilege, the second /proc.
bool Publish(int fd, const std::string &path) {
    if (linkat(fd, "", AT_FDCWD, path.c_str(), AT_EMPTY_PATH) == 0) {
        return true;
    }
    const std::string self = "/proc/self/fd/" + std::to_string(fd);
    return linkat(AT_FDCWD, self.c_str(), AT_FDCWD, path.c_str(), AT_SYMLINK_FOLLOW) == 0;
}

/// For file systems without nameless files, or that do not name them later. Here a reader, or a power cut, may
/// find the file empty. One that could not be written goes away again: empty it would be a broken configuration,
/// missing it is none yet.
bool CreateByName(const std::string &path, const std::string &text) {
    const UniqueFd fd = Open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | kOpenFlags, 0644);
    if (!fd) {
        return false;
    }
    (void)AwaitDataLock(fd.Get(), LOCK_EX);
    if (Fill(fd.Get(), text) && FlushNames(DirectoryOf(path))) {
        return true;
    }
    (void)unlink(path.c_str());
    return false;
}

/// Creates the file with its content in one step: it is written without a name and gets the name last, so nobody
/// ever finds it empty or half written, and a writer that dies leaves nothing.
bool Create(const std::string &path, const std::string &text) {
    const UniqueFd fd = Open(DirectoryOf(path).c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0644);
    if (!fd) {
        const bool unsupported = errno == EOPNOTSUPP || errno == EISDIR || errno == EINVAL;
        return unsupported && CreateByName(path, text);
    }
    if (!Fill(fd.Get(), text)) {
        return false;
    }
    if (!Publish(fd.Get(), path)) {
        return errno != EEXIST && CreateByName(path, text);
    }
    if (!FlushNames(DirectoryOf(path))) {
        (void)unlink(path.c_str());
        return false;
    }
    return true;
}

}  // namespace

bool ReadFile(const std::string &path, std::string &text, bool &undisturbed) {
    const UniqueFd fd = Open(path.c_str(), O_RDONLY | kOpenFlags);
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
    const FileContent content = ContentOf(text);
    if (content.state != FileState::kPlain) {
        text = std::string(content.document);
    }
    return true;
}

bool WriteFile(const std::string &path, const std::string &text) {
    UniqueFd fd = Open(path.c_str(), O_RDWR | kOpenFlags);
    if (!fd && errno == ENOENT) {
        if (Create(path, text)) {
            return true;
        }
        // Another writer may have made it meanwhile.
        fd = Open(path.c_str(), O_RDWR | kOpenFlags);
    }
    return fd && Replace(fd, text);
}

}  // namespace VORK::FILEINDEX::internal
