#include "config/tail.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>

namespace VORK::FILEINDEX::internal {

namespace {

// The size of a page of memory, the unit in which the kernel copies and flushes a write. A file system with larger
// blocks flushes several at once, which loses nothing.
constexpr std::size_t kPage = 4096;

// It begins with a NUL, so that no document can hold a trailer. The rest is text, for people who find one.
constexpr std::size_t kTrailerSize = 40;

/// FNV-1a: it has to tell a torn text from a whole one, not to resist an attacker.
std::uint64_t Checksum(std::string_view text) {
    std::uint64_t sum = 0xcbf29ce484222325U;
    for (const char c : text) {
        sum = (sum ^ static_cast<unsigned char>(c)) * 0x100000001b3U;
    }
    return sum;
}

std::string Trailer(std::string_view document) {
    std::array<char, kTrailerSize + 1> text{};
    std::snprintf(text.data(), text.size(), "%ctail %016llx %016llx\n", '\0',
                  static_cast<unsigned long long>(document.size()),
                  static_cast<unsigned long long>(Checksum(document)));
    return {text.data(), kTrailerSize};
}

/// The document of a whole tail at the end of the bytes; no data where there is none.
std::string_view InTail(std::string_view bytes) {
    if (bytes.size() < kTrailerSize) {
        return {};
    }
    const std::string_view trailer = bytes.substr(bytes.size() - kTrailerSize);
    unsigned long long size = 0;
    if (trailer.front() != '\0' ||
        std::sscanf(std::string(trailer.substr(1)).c_str(), "tail %16llx", &size) != 1 ||
        size > bytes.size() - kTrailerSize) {
        return {};
    }
    const std::size_t begin = bytes.size() - kTrailerSize - size;
    const std::string_view document = bytes.substr(begin, size);
    const bool isInPlace = begin > 0 && begin % kPage == 0 && bytes[begin - 1] == '\0';
    return isInPlace && trailer == Trailer(document) ? document : std::string_view();
}

}  // namespace

std::string TailAfter(std::size_t oldSize, std::string_view document) {
    const std::size_t begin = (std::max(oldSize, document.size()) / kPage + 1) * kPage;
    std::string tail(begin - oldSize, '\0');
    tail += document;
    tail += Trailer(document);
    return tail;
}

FileContent ContentOf(std::string_view bytes) {
    const std::size_t end = bytes.find('\0');
    if (end == std::string_view::npos) {
        return {FileState::kPlain, bytes};
    }
    const std::string_view document = InTail(bytes);
    if (document.data() != nullptr) {
        return {FileState::kWholeTail, document};
    }
    return {FileState::kTorn, bytes.substr(0, end)};
}

}  // namespace VORK::FILEINDEX::internal
