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
    JsonScanner(std::string_view text, std::string &decoded);

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

    bool TakeString(std::string_view &content);
    bool TakeBool(bool &value);
    bool TakeUnsigned(unsigned &value);

    /// Takes any value.
    bool Skip();

    /// Has the whole text been taken?
    bool AtEnd();

private:
    void SkipBlanks();
    bool Take(std::string_view literal);
    bool TakeMark(char mark);
    bool Open(char mark);
    bool Close();
    bool SkipArray();
    bool SkipNumber();
    bool TakeEscaped(std::string_view &content);
    bool TakeEscape();
    bool TakeCodePoint();
    bool TakeHex(unsigned &value);

    std::string_view rest_;
    std::string &decoded_;
    int depth_ = 0;
};

}  // namespace VORK
