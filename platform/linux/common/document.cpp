#include "common/document.h"

#include <json/reader.h>
#include <json/writer.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <memory>
#include <thread>

namespace VORK::PLATFORM {

namespace {

constexpr std::chrono::milliseconds kLockWait{2000};
constexpr std::chrono::milliseconds kLockRetry{2};
constexpr int kMaxNesting = 256;

bool WriteAll(int fd, const std::string &text) {
    size_t done = 0;
    while (done < text.size()) {
        const ssize_t written = write(fd, text.data() + done, text.size() - done);
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written < 0) {
            return false;
        }
        done += static_cast<size_t>(written);
    }
    return true;
}

// Where the file really is: replacing a link by a file would part it from the place it was meant to share.
std::string FollowLink(const std::string &path) {
    const std::unique_ptr<char, decltype(&std::free)> real(realpath(path.c_str(), nullptr), &std::free);
    return real == nullptr ? path : std::string(real.get());
}

bool TakeOverModeAndOwner(int fd, const std::string &path, mode_t modeIfNew) {
    struct stat old {};
    if (stat(path.c_str(), &old) != 0) {
        return errno == ENOENT && fchmod(fd, modeIfNew) == 0;
    }
    return fchown(fd, old.st_uid, old.st_gid) == 0 && fchmod(fd, old.st_mode & 07777U) == 0;
}

bool WriteTemporary(const std::string &temporary, const std::string &target, const std::string &text,
                    mode_t modeIfNew) {
    const UniqueFd file = Open(temporary.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_NOFOLLOW | O_CLOEXEC, 0600);
    if (!file) {
        return false;
    }
    return WriteAll(file.Get(), text) && TakeOverModeAndOwner(file.Get(), target, modeIfNew) &&
           fsync(file.Get()) == 0;
}

// Makes the rename itself durable. The new text is in place whatever comes of it.
void SyncDirectoryOf(const std::string &path) {
    const UniqueFd directory =
        Open(path.substr(0, path.rfind('/') + 1).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (directory) {
        fsync(directory.Get());
    }
}

}  // namespace

std::optional<Json::Value> ParseObject(const std::string &text) try {
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    builder["stackLimit"] = kMaxNesting;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value document;
    std::string problems;
    if (!reader->parse(text.data(), text.data() + text.size(), &document, &problems) || !document.isObject()) {
        return std::nullopt;
    }
    return document;
} catch (const Json::Exception &) {
    return std::nullopt;
}

std::string FormatDocument(const Json::Value &document) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "  ";
    builder["emitUTF8"] = true;
    return Json::writeString(builder, document) + "\n";
}

bool ReplaceFile(const std::string &path, const std::string &text, unsigned int mode) {
    const std::string target = FollowLink(path);
    const std::string temporary = target + ".tmp";
    if (WriteTemporary(temporary, target, text, mode) && rename(temporary.c_str(), target.c_str()) == 0) {
        SyncDirectoryOf(target);
        return true;
    }
    const int error = errno;
    unlink(temporary.c_str());
    errno = error;
    return false;
}

FileLock::~FileLock() {
    if (file_) {
        flock(file_.Get(), LOCK_UN);
    }
}

std::optional<FileLock> TakeLock(const std::string &lockPath) {
    UniqueFd file = Open(lockPath.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0600);
    if (!file) {
        return std::nullopt;
    }
    const auto deadline = std::chrono::steady_clock::now() + kLockWait;
    while (flock(file.Get(), LOCK_EX | LOCK_NB) != 0) {
        if (errno != EWOULDBLOCK && errno != EINTR) {
            return std::nullopt;
        }
        if (std::chrono::steady_clock::now() >= deadline) {
            errno = ETIMEDOUT;
            return std::nullopt;
        }
        std::this_thread::sleep_for(kLockRetry);
    }
    return FileLock(std::move(file));
}

}  // namespace VORK::PLATFORM
