#include "base/queue/lines.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <utility>

namespace VORK {

namespace {

constexpr std::size_t kBlock = 64 * 1024;
constexpr std::size_t kShortQueue = 4 * 1024;
constexpr std::size_t kMaxLine = 1024 * 1024;  // longer than any record; a file without newlines is no queue
constexpr std::size_t kShownOfPassed = 256;

}  // namespace

QueueLines::QueueLines(UniqueFd file, off_t from, off_t end) : file_(std::move(file)), end_(end), read_(from) {}

bool QueueLines::Next(QueueLine &line) {
    do {
        while (begin_ == whole_) {
            if (ended_) {
                return false;  // what was appended since belongs to the line that was read without its newline
            }
            if (Passes(line)) {
                return line.offset < end_;
            }
            if (!Fill()) {
                return TakeRest(line);
            }
        }
        TakeWhole(line);
    } while (mayMatter_ && !mayMatter_(line.text));
    return line.offset < end_;
}

/// Passes over what was read of a line that turns out to be malformed. True once for each such line.
bool QueueLines::Passes(QueueLine &line) {
    const off_t offset = Offset();
    const std::size_t length = filled_ - begin_;
    const bool malformed = length > kMaxLine || PassHole();
    if (!malformed && !passedFrom_) {
        return false;
    }
    const bool first = !passedFrom_;
    if (first) {
        passedFrom_ = offset;
        line = {{buffer_.get() + begin_, std::min(length, kShownOfPassed)}, true, false, offset};
    }
    begin_ = whole_ = filled_;
    return first;
}

/// Goes on after a hole, of which what was read last may be the beginning. False when there is none, or the file
/// system tells of none.
bool QueueLines::PassHole() {
    if (!endsInNul_) {
        return false;
    }
    off_t data = lseek(file_.Get(), read_, SEEK_DATA);
    if (data < 0 && errno == ENXIO) {
        // No data is left. The end is read all the same: Linux does not find data in the last page a file can
        // have.
        data = lseek(file_.Get(), 0, SEEK_END) - static_cast<off_t>(kBlock);
    }
    if (data <= read_) {
        return false;
    }
    read_ = data;
    return true;
}

void QueueLines::TakeWhole(QueueLine &line) {
    const char *text = buffer_.get() + begin_;
    const auto *newline = static_cast<const char *>(std::memchr(text, '\n', whole_ - begin_));
    const auto length = static_cast<std::size_t>(newline - text);
    const bool tooLong = length > kMaxLine;
    line = {{text, tooLong ? kShownOfPassed : length}, tooLong, true, Offset()};
    begin_ += length + 1;
}

bool QueueLines::TakeRest(QueueLine &line) {
    ended_ = true;
    line = {{buffer_.get() + begin_, filled_ - begin_}, false, false, Offset()};
    return !line.text.empty() && line.offset < end_ && (!mayMatter_ || mayMatter_(line.text));
}

/// Adds a block to what is not taken, which moves to the front. False at the end of the file.
bool QueueLines::Fill() {
    std::copy(buffer_.get() + begin_, buffer_.get() + filled_, buffer_.get());
    filled_ -= begin_;
    begin_ = whole_ = 0;
    MakeRoom();
    const std::size_t before = filled_;
    if (!Read()) {
        return false;
    }
    FindWhole(before);
    return true;
}

void QueueLines::MakeRoom() {
    // Most queues are short: they get no more than they need.
    const std::size_t needed = read_ == 0 ? kShortQueue : filled_ < kBlock / 2 ? kBlock : filled_ + kBlock;
    if (needed <= capacity_) {
        return;
    }
    std::unique_ptr<char[]> larger(new char[needed]);  // not cleared: read into
    std::copy_n(buffer_.get(), filled_, larger.get());
    buffer_ = std::move(larger);
    capacity_ = needed;
}

bool QueueLines::Read() {
    // No further than a file can reach, and no more than a block, of which a hole cannot hide much.
    const auto upToLast = static_cast<std::size_t>(kNoEnd - read_);
    const std::size_t wanted = std::min({capacity_ - filled_, upToLast, kBlock});
    ssize_t count = 0;
    do {
        count = pread(file_.Get(), buffer_.get() + filled_, wanted, read_);
    } while (count < 0 && errno == EINTR);
    if (count <= 0) {
        return false;
    }
    filled_ += static_cast<std::size_t>(count);
    read_ += count;
    endsInNul_ = buffer_[filled_ - 1] == '\0';
    return true;
}

/// Newlines are looked for only in what was read since, from `from` on.
void QueueLines::FindWhole(std::size_t from) {
    const char *text = buffer_.get();
    const auto *last = static_cast<const char *>(memrchr(text + from, '\n', filled_ - from));
    if (last == nullptr) {
        return;
    }
    whole_ = static_cast<std::size_t>(last - text) + 1;
    if (passedFrom_) {
        const auto *first = static_cast<const char *>(std::memchr(text, '\n', whole_));
        begin_ = static_cast<std::size_t>(first - text) + 1;
        passedFrom_.reset();
    }
    if (mayMatter_ && !mayMatter_({text + begin_, whole_ - begin_})) {
        begin_ = whole_;
    }
}

}  // namespace VORK
