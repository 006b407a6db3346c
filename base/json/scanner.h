/// \file
/// JSON text taken apart from front to back, without making a document of it.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace VORK {

/// Takes one value after the other off a text, blanks before it included. What it takes, JsonReader reads the
/// same; it refuses also what it is only not sure of: extreme numbers, deep nesting, halves of surrogate pairs. So
/// nothing follows from a refusal but that JsonReader has to be asked. After one, the scanner is of no more use.
class JsonScanner {
public:
    /// `decoded` becomes the home of strings that have escapes. Strings without any are views into the text.
    JsonScanner(std::string_view text, std::string &decoded) : rest_(text), decoded_(decoded) { decoded_.clear(); }

    /// Calls `takeValue(name)` for each member; it takes the member's value and answers whether it could.
    template <typename TakeValue>
    bool TakeObject(TakeValue takeValue) {
        if (!Open('{')) {
            return false;
        }
        if (TakeMark('}')) {
            return Close();
        }
        do {
            std::string_view name;
            if (!TakeString(name) || !TakeMark(':') || !takeValue(name)) {
                return false;
            }
        } while (TakeMark(','));
        return TakeMark('}') && Close();
    }

    bool TakeString(std::string_view &content) {
        constexpr std::size_t kShort = 12;  // most names of members
        if (!TakeMark('"')) {
            return false;
        }
        const std::size_t searched = rest_.size() < kShort ? rest_.size() : kShort;
        for (std::size_t i = 0; i < searched && rest_[i] != '\\' && rest_[i] != '\0'; ++i) {
            if (rest_[i] == '"') {
                content = rest_.substr(0, i);
                rest_.remove_prefix(i + 1);
                return true;
            }
        }
        return TakeLong(content);
    }
    bool TakeBool(bool &value);
    bool TakeUnsigned(unsigned &value);

    /// Takes any value.
    bool Skip();

    /// Has the whole text been taken?
    bool AtEnd();

private:
    // In the header, because a short line consists of little else.
    void SkipBlanks() {
        while (!rest_.empty() && rest_.front() <= ' ' && IsBlank(rest_.front())) {
            rest_.remove_prefix(1);
        }
    }
    bool TakeMark(char mark) {
        SkipBlanks();
        const bool there = !rest_.empty() && rest_.front() == mark;
        rest_.remove_prefix(there ? 1 : 0);
        return there;
    }
    static bool IsBlank(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; }

    bool Take(std::string_view literal) {
        const bool there = rest_.starts_with(literal);
        rest_.remove_prefix(there ? literal.size() : 0);
        return there;
    }
    bool Open(char mark) { return TakeMark(mark) && ++depth_ <= kMaxDepth; }
    bool Close() {
        --depth_;
        return true;
    }
    bool SkipArray();
    bool SkipNumber();
    bool TakeLong(std::string_view &content);
    bool TakeEscaped(std::string_view &content);
    bool TakeEscape();
    bool TakeCodePoint();
    bool TakeHex(unsigned &value);

    static constexpr int kMaxDepth = 16;  // far below the exact reader's limit

    std::string_view rest_;
    std::string &decoded_;
    int depth_ = 0;
};

}  // namespace VORK
