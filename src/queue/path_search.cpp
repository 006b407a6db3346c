#include "queue/path_search.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <utility>

namespace VORK::FILEINDEX::internal {

namespace {

constexpr std::size_t kMaxTail = 40;

bool Contains(std::string_view text, std::string_view part) {
    return memmem(text.data(), text.size(), part.data(), part.size()) != nullptr;
}

}  // namespace

PathSearch::PathSearch(std::string path)
    : path_(std::move(path)),
      hasQuote_(path_.find_first_of("\"\\") != std::string::npos),
      tail_(std::string_view(path_).substr(path_.size() - std::min(path_.size(), kMaxTail))) {
    for (std::size_t i = 0; i + kWindow <= tail_.size(); ++i) {
        hashes_.set(HashOf(tail_.data() + i));
    }
}

std::size_t PathSearch::HashOf(const char *window) {
    constexpr std::uint64_t kMix = 0x9E3779B97F4A7C15;
    std::uint64_t bytes = 0;
    std::memcpy(&bytes, window, kWindow);
    return static_cast<std::size_t>(bytes * kMix >> (64 - kHashBits));
}

/// Most escapes in names are those of quotes and backslashes, which few paths have.
bool PathSearch::HasEscape(std::string_view text) const {
    for (;;) {
        const std::size_t escape = text.find('\\');
        if (escape == std::string_view::npos) {
            return false;
        }
        const bool atEnd = escape + 1 == text.size();
        if (atEnd || hasQuote_ || (text[escape + 1] != '"' && text[escape + 1] != '\\')) {
            return true;
        }
        text.remove_prefix(escape + 2);
    }
}

/// Looks at one window in every few: wherever the tail stands, one of those looked at lies within it.
bool PathSearch::HasTail(std::string_view text) const {
    if (tail_.size() < kWindow) {
        return Contains(text, tail_);
    }
    const std::size_t around = tail_.size() - kWindow;
    for (std::size_t i = 0; i + kWindow <= text.size(); i += around + 1) {
        const std::size_t begin = i - std::min(i, around);
        if (hashes_[HashOf(text.data() + i)] && Contains(text.substr(begin, i - begin + tail_.size()), tail_)) {
            return true;
        }
    }
    return false;
}

}  // namespace VORK::FILEINDEX::internal
