#include "base/json/scanner.h"

#include "base/has_nul.h"
#include "base/json/number.h"

#include <algorithm>
#include <charconv>
#include <cstring>
#include <system_error>

namespace VORK {

namespace {

constexpr std::size_t kMaxNumber = 64;  // with an exponent of two digits: far from the ends of the range
constexpr std::size_t kMaxExponent = 2;

bool IsSurrogate(unsigned unit, unsigned half) {
    return (unit & 0xFC00) == half;
}

void AppendUtf8(std::string &out, unsigned codePoint) {
    if (codePoint < 0x80) {
        out += static_cast<char>(codePoint);
        return;
    }
    const int following = codePoint < 0x800 ? 1 : codePoint < 0x10000 ? 2 : 3;
    constexpr unsigned kLead[] = {0, 0xC0, 0xE0, 0xF0};
    out += static_cast<char>(kLead[following] | codePoint >> (6 * following));
    for (int i = following - 1; i >= 0; --i) {
        out += static_cast<char>(0x80 | (codePoint >> (6 * i) & 0x3F));
    }
}

}  // namespace

/// Any string, after its opening quote.
bool JsonScanner::TakeLong(std::string_view &content) {
    const std::size_t end = rest_.find('"');
    if (end == std::string_view::npos) {
        return false;
    }
    if (std::memchr(rest_.data(), '\\', end) != nullptr) {
        return TakeEscaped(content);
    }
    content = rest_.substr(0, end);
    rest_.remove_prefix(end + 1);
    return !HasNul(content);  // which ends the text for the exact reader
}

/// A string with escapes, after its opening quote.
bool JsonScanner::TakeEscaped(std::string_view &content) {
    // Never longer than what stands for it; so what was decoded before stays where it is.
    decoded_.reserve(decoded_.size() + rest_.size());
    const std::size_t begin = decoded_.size();
    for (;;) {
        const auto special =
            std::find_if(rest_.begin(), rest_.end(), [](char c) { return c == '"' || c == '\\' || c == '\0'; });
        decoded_.append(rest_.begin(), special);
        rest_.remove_prefix(static_cast<std::size_t>(special - rest_.begin()));
        if (Take("\"")) {
            content = std::string_view(decoded_).substr(begin);
            return true;
        }
        if (!Take("\\") || !TakeEscape()) {
            return false;
        }
    }
}

/// What follows a backslash.
bool JsonScanner::TakeEscape() {
    if (rest_.empty()) {
        return false;
    }
    constexpr std::string_view kLetters = "\"\\/bfnrt";
    constexpr std::string_view kMeant = "\"\\/\b\f\n\r\t";
    const std::size_t letter = kLetters.find(rest_.front());
    if (letter == std::string_view::npos) {
        return Take("u") && TakeCodePoint();
    }
    decoded_ += kMeant[letter];
    rest_.remove_prefix(1);
    return true;
}

bool JsonScanner::TakeCodePoint() {
    constexpr unsigned kHigh = 0xD800;
    constexpr unsigned kLow = 0xDC00;
    unsigned unit = 0;
    if (!TakeHex(unit) || IsSurrogate(unit, kLow)) {
        return false;
    }
    if (IsSurrogate(unit, kHigh)) {
        unsigned low = 0;
        if (!Take("\\u") || !TakeHex(low) || !IsSurrogate(low, kLow)) {
            return false;
        }
        unit = 0x10000 + ((unit - kHigh) << 10) + (low - kLow);
    }
    AppendUtf8(decoded_, unit);
    return true;
}

bool JsonScanner::TakeHex(unsigned &value) {
    constexpr std::size_t kDigits = 4;
    constexpr int kBase = 16;
    const char *begin = rest_.data();
    if (rest_.size() < kDigits || std::from_chars(begin, begin + kDigits, value, kBase).ptr != begin + kDigits) {
        return false;
    }
    rest_.remove_prefix(kDigits);
    return true;
}

bool JsonScanner::TakeBool(bool &value) {
    SkipBlanks();
    value = rest_.starts_with('t');
    return Take(value ? "true" : "false");
}

bool JsonScanner::TakeUnsigned(unsigned &value) {
    SkipBlanks();
    const char *begin = rest_.data();
    const auto [end, error] = std::from_chars(begin, begin + rest_.size(), value);
    const auto length = static_cast<std::size_t>(end - begin);
    if (error != std::errc() || (length > 1 && rest_.front() == '0')) {
        return false;
    }
    rest_.remove_prefix(length);
    return true;
}

bool JsonScanner::Skip() {
    SkipBlanks();
    if (rest_.empty()) {
        return false;
    }
    std::string_view content;
    switch (rest_.front()) {
        case '"':
            return TakeString(content);
        case '{':
            return TakeObject([this](std::string_view) { return Skip(); });
        case '[':
            return SkipArray();
        case 't':
            return Take("true");
        case 'f':
            return Take("false");
        case 'n':
            return Take("null");
        default:
            return SkipNumber();
    }
}

bool JsonScanner::SkipArray() {
    if (!Open('[')) {
        return false;
    }
    if (TakeMark(']')) {
        return Close();
    }
    do {
        if (!Skip()) {
            return false;
        }
    } while (TakeMark(','));
    return TakeMark(']') && Close();
}

bool JsonScanner::SkipNumber() {
    const std::string_view number = rest_.substr(0, NumberLength(rest_));
    const std::size_t exponent = number.find_first_of("eE");
    if (number.empty() || number.size() > kMaxNumber ||
        (exponent != std::string_view::npos && number.find_last_of("eE+-") + 1 + kMaxExponent < number.size())) {
        return false;
    }
    rest_.remove_prefix(number.size());
    return true;
}

bool JsonScanner::AtEnd() {
    SkipBlanks();
    return rest_.empty();
}

}  // namespace VORK
