#include "text.h"

#include <unistr.h>
#include <uniwidth.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>

namespace fileindexctl {

namespace {

constexpr unsigned kGap = 2;
constexpr unsigned kShortestPath = 12;

const std::uint8_t *Bytes(const std::string &text) {
    return reinterpret_cast<const std::uint8_t *>(text.data());
}

bool IsUtf8(const std::string &text) {
    return u8_check(Bytes(text), text.size()) == nullptr;
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

std::vector<unsigned> ColumnWidths(const std::vector<std::vector<std::string>> &rows) {
    std::vector<unsigned> widths;
    for (const auto &row : rows) {
        widths.resize(std::max(widths.size(), row.size()));
        for (std::size_t column = 0; column < row.size(); ++column) {
            widths[column] = std::max(widths[column], DisplayWidth(row[column]));
        }
    }
    return widths;
}

unsigned FirstColumnWidth(const std::vector<unsigned> &widths, unsigned width) {
    unsigned others = 0;
    for (std::size_t column = 1; column < widths.size(); ++column) {
        others += kGap + widths[column];
    }
    const unsigned left = width > others ? width - others : 0;
    return std::min(widths.front(), std::max(left, kShortestPath));
}

}  // namespace

std::string Printable(const std::string &text) {
    std::string result;
    for (std::size_t i = 0; i < text.size(); ++i) {
        const auto byte = static_cast<unsigned char>(text[i]);
        const auto next = static_cast<unsigned char>(i + 1 < text.size() ? text[i + 1] : 0);
        if (byte < 0x20 || byte == 0x7F) {
            result += Escape(byte);
        } else if (byte == 0xC2 && next >= 0x80 &&
                   next < 0xA0) {  // terminals obey the upper control characters too
            result += Escape(byte) + Escape(next);
            ++i;
        } else {
            result += text[i];
        }
    }
    return result;
}

std::string AsUtf8(const std::string &text) {
    std::string result;
    for (std::size_t i = 0; i < text.size();) {
        ucs4_t character = 0;
        const int length = u8_mbtoucr(&character, Bytes(text) + i, text.size() - i);
        if (length > 0) {
            result.append(text, i, static_cast<std::size_t>(length));
        } else {
            result += Escape(static_cast<unsigned char>(text[i]));
        }
        i += static_cast<std::size_t>(std::max(length, 1));
    }
    return result;
}

unsigned DisplayWidth(const std::string &text) {
    const int width = IsUtf8(text) ? u8_width(Bytes(text), text.size(), "UTF-8") : -1;
    return width >= 0 ? static_cast<unsigned>(width) : static_cast<unsigned>(text.size());
}

std::string ShortenFront(const std::string &text, unsigned width) {
    if (DisplayWidth(text) <= width) {
        return text;
    }
    const bool utf8 = IsUtf8(text);
    std::string rest = text;
    while (!rest.empty() && DisplayWidth(rest) + 3 > width) {
        const int length = utf8 ? u8_mblen(Bytes(rest), rest.size()) : 1;
        rest.erase(0, static_cast<std::size_t>(std::max(length, 1)));
    }
    return "..." + rest;
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

std::vector<std::string> Align(std::vector<std::vector<std::string>> rows, unsigned width) {
    for (auto &row : rows) {
        std::transform(row.begin(), row.end(), row.begin(), Printable);
    }
    std::vector<unsigned> widths = ColumnWidths(rows);
    if (width > 0 && !widths.empty()) {
        widths.front() = FirstColumnWidth(widths, width);
        for (auto &row : rows) {
            row.front() = ShortenFront(row.front(), widths.front());
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
        lines.push_back(std::move(line));
    }
    return lines;
}

}  // namespace fileindexctl
