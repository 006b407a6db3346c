#include "queue/queue_file.h"

#include "base/json/text.h"
#include "base/metadata_entry.h"
#include "base/unique_fd.h"
#include "json/ordinary.h"
#include "names.h"

#include <json/value.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <iterator>
#include <limits>
#include <memory>
#include <optional>
#include <utility>

namespace VORK::FILEINDEX::internal {

namespace {

constexpr std::size_t kBlockSize = 64 * 1024;
constexpr std::size_t kMaxLine = 1024 * 1024;  // longer than any record; a file without newlines is no queue
constexpr std::size_t kShownOfLongLine = 256;
constexpr std::size_t kRoomForMore = 1024;

/// Some whole lines, newlines included; the file's last line may lack it.
struct Lines {
    std::string_view text;
    bool passed =
        false;         ///< the beginning of one malformed line that is passed over: too long, or with a hole in it
    off_t offset = 0;  ///< where the text begins in the file
};

/// Reads a queue file in blocks and cuts them between lines.
class BlockReader {
public:
    /// False with the reason in `errno`.
    bool Open(const std::string &path, struct stat &status) {
        fd_ = MetadataEntry(path).OpenFile(O_RDONLY, status);
        if (!fd_) {
            return false;
        }
        // Most queues are short: they get no more than they need.
        Grow(std::min(kBlockSize, static_cast<std::size_t>(status.st_size) + kRoomForMore));
        return true;
    }

    void StartAt(off_t offset) { read_ = after_whole_ = offset; }

    /// Where in the file the first line begins that has not been delivered whole.
    off_t AfterWholeLines() const { return after_whole_; }

    bool Next(Lines &lines) {
        DropDelivered();
        if (at_end_) {
            return false;  // what was appended since belongs to the line that was delivered without its newline
        }
        for (;;) {
            const std::size_t end = EndOfLastLine();
            if (end > 0 && skipping_) {
                SkipToNewline();
                continue;
            }
            if (end > 0) {
                return Deliver(lines, end);
            }
            const bool isPassed = filled_ > kMaxLine || PassHole();
            if (!skipping_ && isPassed) {
                skipping_ = true;
                lines = {{buffer_.get(), std::min(filled_, kShownOfLongLine)}, true, 0};
                return true;
            }
            if (skipping_) {
                filled_ = 0;
            }
            at_end_ = !Fill();
            if (at_end_) {
                break;
            }
        }
        lines = {{buffer_.get(), filled_}, false, read_ - static_cast<off_t>(filled_)};
        delivered_ = filled_;
        Pad();
        return filled_ > 0;
    }

private:
    std::size_t EndOfLastLine() const {
        const void *newline = memrchr(buffer_.get(), '\n', filled_);
        return newline == nullptr
                   ? 0
                   : static_cast<std::size_t>(static_cast<const char *>(newline) - buffer_.get()) + 1;
    }

    bool Deliver(Lines &lines, std::size_t size) {
        lines = {{buffer_.get(), size}, false, read_ - static_cast<off_t>(filled_)};
        delivered_ = size;
        Pad();
        after_whole_ = read_ - static_cast<off_t>(filled_ - size);
        return true;
    }

    void DropDelivered() { Drop(std::exchange(delivered_, 0)); }

    void Drop(std::size_t size) {
        std::memmove(buffer_.get(), buffer_.get() + size, filled_ - size);
        filled_ -= size;
    }

    void SkipToNewline() {
        const void *newline = std::memchr(buffer_.get(), '\n', filled_);
        Drop(static_cast<std::size_t>(static_cast<const char *>(newline) - buffer_.get()) + 1);
        after_whole_ = read_ - static_cast<off_t>(filled_);
        skipping_ = false;
    }

    /// Goes on after a hole, of which what was read last may be the beginning: it reads as NULs, which no line
    /// holds, and can be longer than anybody could read. False when there is none, or the file system tells of
    /// none.
    bool PassHole() {
        if (!ends_in_nul_) {
            return false;
        }
        off_t data = lseek(fd_.Get(), read_, SEEK_DATA);
        if (data < 0 && errno == ENXIO) {
            // No data is left. The end is read all the same: Linux does not find data in the last page a file can
            // have.
            data = lseek(fd_.Get(), 0, SEEK_END) - static_cast<off_t>(kBlockSize);
        }
        if (data <= read_) {
            return false;
        }
        read_ = data;
        return true;
    }

    /// False at the end of the file; a read error ends it too.
    bool Fill() {
        if (filled_ == capacity_) {
            // A file that grew, or a line longer than the block and shorter than the longest allowed.
            Grow(std::min(std::max(filled_ * 2, kBlockSize), kMaxLine + kBlockSize));
        }
        // No further than a file can reach, and no more than a block, of which a hole cannot hide much.
        const auto upToLast = static_cast<std::size_t>(std::numeric_limits<off_t>::max() - read_);
        const std::size_t wanted = std::min({capacity_ - filled_, upToLast, kBlockSize});
        ssize_t count = 0;
        do {
            count = pread(fd_.Get(), buffer_.get() + filled_, wanted, read_);
        } while (count < 0 && errno == EINTR);
        if (count <= 0) {
            return false;
        }
        filled_ += static_cast<std::size_t>(count);
        read_ += count;
        ends_in_nul_ = buffer_[filled_ - 1] == '\0';
        return true;
    }

    void Grow(std::size_t capacity) {
        std::unique_ptr<char[]> larger(new char[capacity + OrdinaryReader::kPadding]);  // not cleared: read into
        std::copy_n(buffer_.get(), filled_, larger.get());
        buffer_ = std::move(larger);
        capacity_ = capacity;
    }

    void Pad() { std::fill_n(buffer_.get() + filled_, OrdinaryReader::kPadding, '\0'); }

    UniqueFd fd_;
    std::unique_ptr<char[]> buffer_;
    std::size_t capacity_ = 0;
    std::size_t filled_ = 0;
    std::size_t delivered_ = 0;
    off_t read_ = 0;
    off_t after_whole_ = 0;
    bool ends_in_nul_ = false;
    bool skipping_ = false;
    bool at_end_ = false;
};

/// Tells what one line says: the fast reader where it is sure, the exact one otherwise.
class LineReader {
public:
    /// Null when the line is malformed. Readable bytes have to follow the line (OrdinaryReader::kPadding).
    const QueueEvent *Read(std::string_view line, bool whole, off_t offset) {
        OrdinaryEvent event;
        if (ordinary_.ReadEvent(line, event)) {
            event_ = {event.type, event.path, event.oldPath};
        } else if (!ReadExactly(line)) {
            return nullptr;
        }
        if (event_.type != kRenameEvent) {
            event_.oldPath = {};
        }
        event_.whole = whole;
        event_.offset = offset;
        return &event_;
    }

private:
    bool ReadExactly(std::string_view line) {
        if (!exact_) {
            exact_.emplace();
        }
        if (!exact_->Parse(line, record_) || !record_.isObject()) {
            return false;
        }
        const Json::Value *type = Member(kEventKey);
        std::string_view path;
        if (type == nullptr || !type->isConvertibleTo(Json::uintValue) || !ReadText(kPathKey, path)) {
            return false;
        }
        std::string_view oldPath;
        ReadText(kOldPathKey, oldPath);
        event_ = {type->asUInt(), path, oldPath};
        return true;
    }

    const Json::Value *Member(std::string_view key) const {
        return record_.find(key.data(), key.data() + key.size());
    }

    bool ReadText(std::string_view key, std::string_view &text) const {
        const Json::Value *member = Member(key);
        char const *begin = nullptr;
        char const *end = nullptr;
        if (member == nullptr || !member->getString(&begin, &end)) {
            return false;
        }
        text = {begin, static_cast<std::size_t>(end - begin)};
        return true;
    }

    OrdinaryReader ordinary_;
    std::optional<JsonReader> exact_;
    Json::Value record_;
    QueueEvent event_;
};

/// Takes the first line off `text`, without its newline.
std::string_view TakeLine(std::string_view &text) {
    const std::size_t end = std::min(text.find('\n'), text.size());
    const std::string_view line = text.substr(0, end);
    text.remove_prefix(std::min(end + 1, text.size()));
    return line;
}

bool Contains(std::string_view text, std::string_view part) {
    return memmem(text.data(), text.size(), part.data(), part.size()) != nullptr;
}

/// Visits the lines that `wanted` lets pass. False when the visitor has seen enough.
template <typename Wanted>
bool Visit(const Lines &lines, LineReader &reader, const QueueVisitor &visit, Wanted wanted) {
    if (lines.passed) {
        return visit(lines.text, nullptr);
    }
    for (std::string_view rest = lines.text; !rest.empty();) {
        const std::string_view line = TakeLine(rest);
        if (line.size() > kMaxLine) {
            if (!visit(line.substr(0, kShownOfLongLine), nullptr)) {
                return false;
            }
            continue;
        }
        const bool whole = line.data() + line.size() < lines.text.data() + lines.text.size();
        const off_t offset = lines.offset + (line.data() - lines.text.data());
        if (wanted(line) && !visit(line, reader.Read(line, whole, offset))) {
            return false;
        }
    }
    return true;
}

constexpr auto kEveryLine = [](std::string_view) { return true; };

}  // namespace

bool ScanQueue(const std::string &queueFile, const QueueVisitor &visit) {
    BlockReader blocks;
    struct stat status = {};
    if (!blocks.Open(queueFile, status)) {
        return false;
    }
    LineReader reader;
    Lines lines;
    while (blocks.Next(lines) && Visit(lines, reader, visit, kEveryLine)) {
    }
    return true;
}

bool ScanQueueFrom(const std::string &queueFile, QueuePosition &position, const std::function<void()> &restarted,
                   const QueueVisitor &visit) {
    BlockReader blocks;
    struct stat status = {};
    if (!blocks.Open(queueFile, status)) {
        return false;
    }
    if (status.st_dev != position.device || status.st_ino != position.inode || status.st_size < position.offset) {
        position = {status.st_dev, status.st_ino, 0};
        restarted();
    }
    blocks.StartAt(position.offset);
    LineReader reader;
    Lines lines;
    while (blocks.Next(lines) && Visit(lines, reader, visit, kEveryLine)) {
    }
    position.offset = blocks.AfterWholeLines();
    return true;
}

bool IsInQueueAt(const std::string &queueFile, off_t offset, unsigned type, const std::string &path) {
    BlockReader blocks;
    struct stat status = {};
    if (!blocks.Open(queueFile, status)) {
        return false;
    }
    blocks.StartAt(offset);
    LineReader reader;
    Lines lines;
    bool found = false;
    if (blocks.Next(lines)) {
        Visit(
            lines, reader,
            [&](std::string_view, const QueueEvent *event) {
                found = event != nullptr && event->type == type && event->path == path;
                return false;
            },
            kEveryLine);
    }
    return found;
}

bool FindInQueue(const std::string &queueFile, unsigned type, const std::string &path, bool &found) {
    found = false;
    BlockReader blocks;
    struct stat status = {};
    if (!blocks.Open(queueFile, status)) {
        return false;
    }
    const QueueVisitor visit = [&](std::string_view, const QueueEvent *event) {
        found = event != nullptr && event->type == type && event->path == path;
        return !found;
    };
    // A string without escapes stands in the text as it is: a line that holds neither a backslash nor the path
    // cannot name it, and need not be read.
    const auto mayName = [&](std::string_view text) {
        return std::memchr(text.data(), '\\', text.size()) != nullptr || Contains(text, path);
    };
    LineReader reader;
    Lines lines;
    while (blocks.Next(lines)) {
        if (!lines.passed && mayName(lines.text) && !Visit(lines, reader, visit, mayName)) {
            break;
        }
    }
    return true;
}

}  // namespace VORK::FILEINDEX::internal
