#include "base/json/number.h"

#include <algorithm>

namespace VORK {

namespace {

bool Take(std::string_view &text, char c) {
    const bool there = text.starts_with(c);
    text.remove_prefix(there ? 1 : 0);
    return there;
}

/// How many there were.
std::size_t TakeDigits(std::string_view &text) {
    const auto end = std::find_if_not(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; });
    const auto count = static_cast<std::size_t>(end - text.begin());
    text.remove_prefix(count);
    return count;
}

}  // namespace

std::size_t NumberLength(std::string_view text) {
    std::string_view rest = text;
    Take(rest, '-');
    const bool zero = rest.starts_with('0');
    const std::size_t digits = TakeDigits(rest);
    if (digits == 0 || (zero && digits > 1)) {
        return 0;
    }
    if (Take(rest, '.') && TakeDigits(rest) == 0) {
        return 0;
    }
    if (Take(rest, 'e') || Take(rest, 'E')) {
        if (!Take(rest, '+')) {
            Take(rest, '-');
        }
        if (TakeDigits(rest) == 0) {
            return 0;
        }
    }
    return text.size() - rest.size();
}

}  // namespace VORK
