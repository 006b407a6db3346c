#include "report/text.h"

#include <unictype.h>
#include <unistr.h>
#include <uniwidth.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <numeric>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr unsigned kGap = 2;
constexpr unsigned kNarrowest = 4;
constexpr unsigned kDots = 3;

const std::uint8_t *Bytes(const std::string &text) {
    return reinterpret_cast<const std::uint8_t *>(text.data());
}

// The columns the text takes on a terminal. Takes UTF-8.
unsigned DisplayWidth(const std::string &text) {
    return static_cast<unsigned>(u8_width(Bytes(text), text.size(), "UTF-8"));
}

// No control character, nor one that is not seen, breaks the line or turns the direction of what follows.
bool IsHarmless(ucs4_t character) {
    constexpr std::uint32_t kUnseen = UC_CATEGORY_MASK_Cf | UC_CATEGORY_MASK_Zl | UC_CATEGORY_MASK_Zp;
    return character >= 0x20 && (character < 0x7F || character >= 0xA0) &&
           !uc_is_general_category_withtable(character, kUnseen);
}

std::string Escape(unsigned char byte) {
    if (byte == '\n') {
        return "\\n";
    }
    if (byte == '\t') {
        return "\\t";
    }
    std::array<char, 5> hex{};
    std::snprintf(hex.data(), hex.size(), "\\x%02x", byte);
    return hex.data();
}

std::vector<unsigned> ColumnWidths(const Rows &rows) {
    std::vector<unsigned> widths;
    for (const auto &row : rows) {
        widths.resize(std::max(widths.size(), row.size()));
        for (std::size_t column = 0; column < row.size(); ++column) {
            widths[column] = std::max(widths[column], DisplayWidth(row[column]));
        }
    }
    return widths;
}

// Takes from the widest columns until a row fits.
void Fit(unsigned width, std::vector<unsigned> &widths) {
    unsigned row = kGap * static_cast<unsigned>(widths.size() - 1);
    row = std::accumulate(widths.begin(), widths.end(), row);
    for (; row > width; --row) {
        const auto widest = std::max_element(widths.begin(), widths.end());
        if (*widest <= kNarrowest) {
            return;
        }
        --*widest;
    }
}

// The end of a path and the beginning of other texts, with "..." in the place of the rest. Takes UTF-8.
std::string Shorten(const std::string &text, unsigned width) {
    if (DisplayWidth(text) <= width) {
        return text;
    }
    const std::string dots(std::min(width, kDots), '.');
    const bool isPath = text.starts_with('/');
    std::string kept = text;
    while (DisplayWidth(kept) > width - dots.size()) {
        ucs4_t character = 0;
        const std::uint8_t *begin = Bytes(kept);
        const std::uint8_t *last = u8_prev(&character, begin + kept.size(), begin);
        isPath ? kept.erase(0, static_cast<std::size_t>(u8_mblen(begin, kept.size())))
               : kept.erase(static_cast<std::size_t>(last - begin));
    }
    return isPath ? dots + kept : kept + dots;
}

}  // namespace

std::string Printable(const std::string &text) {
    std::string result;
    for (std::size_t i = 0; i < text.size();) {
        ucs4_t character = 0;
        const int length = u8_mbtoucr(&character, Bytes(text) + i, text.size() - i);
        const std::size_t end = i + static_cast<std::size_t>(std::max(length, 1));
        const bool passes = length > 0 && IsHarmless(character);
        if (passes) {
            result.append(text, i, end - i);
        }
        for (; !passes && i < end; ++i) {
            result += Escape(static_cast<unsigned char>(text[i]));
        }
        i = end;
    }
    return result;
}

std::string Quoted(const std::string &text) {
    return "\"" + text + "\"";
}

std::string ShellWord(const std::string &text) {
    const auto isPlain = [](unsigned char byte) {
        return std::isalnum(byte) != 0 || byte >= 0x80 || std::strchr("/._-+@:", byte) != nullptr;
    };
    if (!text.empty() && std::all_of(text.begin(), text.end(), isPlain)) {
        return text;
    }
    std::string word = "'";
    for (const char character : text) {
        word += character == '\'' ? std::string("'\\''") : std::string(1, character);
    }
    return word + "'";
}

std::string Enumerate(const std::vector<std::string> &items) {
    std::string result;
    for (std::size_t i = 0; i < items.size(); ++i) {
        if (i > 0) {
            result += i + 1 == items.size() ? " and " : ", ";
        }
        result += items[i];
    }
    return result;
}

std::vector<std::string> Align(Rows rows, unsigned width) {
    for (auto &row : rows) {
        std::transform(row.begin(), row.end(), row.begin(), Printable);
    }
    std::vector<unsigned> widths = ColumnWidths(rows);
    if (width > 0 && !widths.empty()) {
        Fit(width, widths);
        for (auto &row : rows) {
            std::transform(row.begin(), row.end(), widths.begin(), row.begin(), Shorten);
        }
    }
    std::vector<std::string> lines;
    for (const auto &row : rows) {
        std::string line;
        for (std::size_t column = 0; column < row.size(); ++column) {
            line += row[column];
            if (column + 1 < row.size()) {
                line.append(widths[column] - DisplayWidth(row[column]) + kGap, ' ');
            }
        }
        line.erase(line.find_last_not_of(' ') + 1);
        lines.push_back(width > 0 ? Shorten(line, width) : std::move(line));
    }
    return lines;
}

}  // namespace VORK::FILEINDEXCTL
