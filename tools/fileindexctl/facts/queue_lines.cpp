#include "facts/queue_lines.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <limits>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr std::size_t kBlock = std::size_t{64} << 10;
constexpr std::size_t kLongestLine = std::size_t{1} << 20;

}  // namespace

bool QueueLines::Next(Line &line) {
    line = {};
    if (read_ - static_cast<off_t>(end_ - begin_) >= size_) {
        return false;
    }
    for (std::size_t searched = 0;;) {
        const char *text = buffer_.data() + begin_;
        const std::size_t length = end_ - begin_;
        const void *newline = length == searched ? nullptr : std::memchr(text + searched, '\n', length - searched);
        const std::size_t found =
            newline == nullptr ? length : static_cast<std::size_t>(static_cast<const char *>(newline) - text);
        line.passed = line.passed || found > kLongestLine || (newline == nullptr && PassHole());
        if (newline != nullptr) {
            begin_ += found + 1;
            line.text = line.passed ? std::string_view() : std::string_view(text, found);
            return true;
        }
        if (line.passed) {
            begin_ = end_;
        }
        searched = end_ - begin_;
        if (!Fill()) {
            line.text = {buffer_.data() + begin_, searched};
            begin_ = end_;
            size_ = 0;
            return line.passed || searched > 0;
        }
    }
}

// Goes on after a hole, of which what was read last may be the beginning. False when there is none, or the file
// system tells of none.
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

// Adds a block to what is not delivered, which moves to the front.
bool QueueLines::Fill() {
    std::copy(buffer_.data() + begin_, buffer_.data() + end_, buffer_.data());
    end_ -= begin_;
    begin_ = 0;
    buffer_.resize(std::max(buffer_.size(), end_ + kBlock));
    const auto upToLast = static_cast<std::size_t>(std::numeric_limits<off_t>::max() - read_);
    ssize_t count = 0;
    do {
        count = pread(file_.Get(), buffer_.data() + end_, std::min(kBlock, upToLast), read_);
    } while (count < 0 && errno == EINTR);
    if (count <= 0) {
        return false;
    }
    end_ += static_cast<std::size_t>(count);
    read_ += count;
    endsInNul_ = buffer_[end_ - 1] == '\0';
    return true;
}

}  // namespace VORK::FILEINDEXCTL
