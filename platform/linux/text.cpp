// Comparing names with case folded.
#include <vork/text.h>

#include <unicase.h>
#include <unistr.h>

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>

namespace {

// Never a byte of UTF-8, so a key shows what was text and what was not.
constexpr char kStrayByteMark = '\xFF';

bool IsAscii(char c) {
    return static_cast<unsigned char>(c) < 0x80;
}

unsigned char FoldAscii(char c) {
    return static_cast<unsigned char>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c);
}

bool AreSameLetter(char a, char b) {
    return IsAscii(a) && IsAscii(b) && FoldAscii(a) == FoldAscii(b);
}

// The length of the UTF-8 at the start of the text.
size_t TextLength(std::string_view text) {
    const auto *start = reinterpret_cast<const uint8_t *>(text.data());
    const uint8_t *stray = u8_check(start, text.size());
    return stray == nullptr ? text.size() : static_cast<size_t>(stray - start);
}

// No language and no normalisation: the folding of a character depends on nothing around it.
void AppendFolded(std::string &key, std::string_view text) {
    size_t length = 0;
    const std::unique_ptr<uint8_t, decltype(&std::free)> folded(
        u8_casefold(reinterpret_cast<const uint8_t *>(text.data()), text.size(), nullptr, nullptr, nullptr,
                    &length),
        &std::free);
    if (folded == nullptr) {
        key += text;
        return;
    }
    key.append(reinterpret_cast<const char *>(folded.get()), length);
}

// Names are compared by comparing keys, byte for byte. Whatever a name holds, it has one key, and that makes the
// comparison a strict weak order. The key of an ASCII name is the name in lower case.
std::string KeyOf(std::string_view name) {
    std::string key;
    while (!name.empty()) {
        const size_t length = TextLength(name);
        if (length > 0) {
            AppendFolded(key, name.substr(0, length));
            name.remove_prefix(length);
        } else {
            key += kStrayByteMark;
            key += name.front();
            name.remove_prefix(1);
        }
    }
    return key;
}

}  // namespace

int VLIBCUnicodeUTF8StrCaseCmp(const char *a, const char *b) {
    const char *left = a == nullptr ? "" : a;
    const char *right = b == nullptr ? "" : b;
    size_t i = 0;
    while (left[i] == right[i] ? left[i] != '\0' : AreSameLetter(left[i], right[i])) {
        ++i;
    }
    const bool followsAscii = i == 0 || IsAscii(left[i - 1]);
    if (left[i] == right[i] || (followsAscii && IsAscii(left[i]) && IsAscii(right[i]))) {
        return FoldAscii(left[i]) - FoldAscii(right[i]);
    }
    // Keys are made of what stands after the last ASCII character that both names share, since whatever comes
    // before it has the same key in both.
    while (i > 0 && !IsAscii(left[i - 1])) {
        --i;
    }
    return KeyOf(left + i).compare(KeyOf(right + i));  // of bytes, unsigned
}
