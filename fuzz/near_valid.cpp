#include "near_valid.h"

#include <utility>

namespace fileindex_fuzz {

namespace {

constexpr std::string_view kBlanks[] = {" ", "  ", "\t", "\n", "\r\n", "\r", "\f", "\v", "\xC2\xA0"};
// One word for each line would fill pages.
// clang-format off
constexpr std::string_view kNumbers[] = {
    "0", "-0", "1", "256", "65536", "131072", "-1", "01", "+1", "1.", ".5", "1.5", "1e2", "1E-2", "-", "0x1",
    "4294967295", "4294967296", "9223372036854775807", "9223372036854775808", "18446744073709551615",
    "18446744073709551616", "-9223372036854775808", "-9223372036854775809", "1e400", "-1e400", "1e-400", "0e0",
    "2.2250738585072014e-308", "4.9e-324", "123456789012345678901234567890", "1.7976931348623157e308", "0.1",
};
constexpr std::string_view kPieces[] = {
    "a", "photo", "/", "/photo/2015", "x y", "\\\"", "\\\\", "\\/", "\\b", "\\f", "\\n", "\\r", "\\t", "\\a",
    "\\", "\\u0041", "\\u00e9", "\\u0000", "\\u001F", "\\uD83D\\uDE00", "\\uD83D", "\\uDE00", "\\uD83Dx",
    "\\u12", "\\uD83D\\u0041", "\\U0041", "\xC3\xA9", "\xE2\x82\xAC", "\xF0\x9F\x98\x80", "\xEF\xBB\xBF", "\xC3",
    "\xFF", "\xC0\x80", "\xED\xA0\x80", "\xF4\x90\x80\x80", "\xE2\x82", "\x01", "\x1F", "\x7F", "\t", "'", "{",
    "]", ",",
};
// clang-format on
constexpr std::string_view kLiterals[] = {"true", "false", "null", "True", "NaN", "Infinity", "-Infinity", "nul"};
constexpr std::string_view kPaths[] = {"/photo/2015", "/a/d", "/a", "/b/d/e", "/ro/d", "/away/x", "/", "", "a"};
constexpr std::string_view kRecordKeys[] = {"name", "document", "audio", "video", "photo"};
constexpr std::string_view kTails[] = {",",  "}",    "]", "x",  " 1",
                                       "//", "/**/", "#", "\n", std::string_view("\0", 1)};

}  // namespace

std::string NearValid::Blank() {
    return OneIn(8) ? std::string(kBlanks[OneIn(20) ? Below(std::size(kBlanks)) : Below(3)]) : std::string();
}

std::string NearValid::Number() {
    return OneIn(2) ? std::to_string(Below(1000)) : std::string(OneOf(kNumbers));
}

std::string NearValid::String() {
    std::string text = "\"";
    for (std::size_t pieces = Below(4); pieces > 0; --pieces) {
        text += kPieces[OneIn(3) ? Below(std::size(kPieces)) : Below(5)];
    }
    return text + '"';
}

std::string NearValid::Quoted(std::string_view usual) {
    return OneIn(12) ? String() : '"' + std::string(usual) + '"';
}

std::string NearValid::Value(int depth) {
    switch (Below(depth > 0 ? 6 : 4)) {
        case 0:
            return Number();
        case 1:
            return std::string(kLiterals[OneIn(10) ? Below(std::size(kLiterals)) : Below(3)]);
        case 4: {
            std::string array = "[";
            for (std::size_t left = Below(4); left > 0; --left) {
                array += Blank();
                array += Value(depth - 1);
                array += left > 1 ? "," : "";
            }
            return array + ']';
        }
        case 5:
            return Object(
                Below(4), [&] { return String(); }, [&] { return Value(depth - 1); });
        default:
            return String();
    }
}

template <typename Key, typename Content>
std::string NearValid::Object(std::size_t members, Key key, Content content) {
    std::string object = "{";
    for (; members > 0; --members) {
        // One by one: the order in which the operands of "+" are made is the compiler's choice.
        for (const std::string &part : {Blank(), key(), Blank(), std::string(":"), Blank(), content(), Blank()}) {
            object += part;
        }
        object += members > 1 ? "," : "";
    }
    return object + '}';
}

std::string NearValid::Record(bool withPath) {
    bool first = withPath;
    bool nameNext = false;
    return Object(
        Below(7) + (withPath ? 1 : 0),
        [&] {
            if (std::exchange(first, false)) {
                return std::string("\"path\"");
            }
            const std::string_view key = OneOf(kRecordKeys);
            nameNext = key == "name";
            return Quoted(key);
        },
        [&] {
            if (std::exchange(withPath, false)) {
                return Quoted(OneOf(kPaths));
            }
            if (OneIn(10)) {
                return Value(2);
            }
            return nameNext ? String() : std::string(OneIn(2) ? "true" : "false");
        });
}

std::string NearValid::QueueLine() {
    std::size_t index = 0;
    std::string_view key;
    constexpr std::string_view kKeys[] = {"event", "path", "data", "path_old", "event", "path"};
    const std::size_t members = OneIn(10) ? Below(7) : 2 + Below(3);
    return Spoil(Object(
        members,
        [&] {
            key = kKeys[index++ % std::size(kKeys)];
            return Quoted(key);
        },
        [&]() -> std::string {
            if (OneIn(15) || key == "data") {
                return Value(3);
            }
            return key == "event" ? OneIn(2) ? "65536" : OneIn(2) ? "256" : Number() : Quoted(OneOf(kPaths));
        }));
}

std::string NearValid::FolderConf() {
    char next = 'a';  // ascending paths for the most part, which is what is written
    return Spoil(Object(
        Below(6),
        [&] {
            next = static_cast<char>(next + Below(3));
            next = static_cast<char>(next + (OneIn(10) ? 0 : 1));
            return Quoted(OneIn(8) ? OneOf(kPaths) : std::string("/photo/") + next);
        },
        [&] { return OneIn(15) ? Value(2) : Record(OneIn(2)); }));
}

std::string NearValid::Document() {
    return Spoil(Value(5));
}

std::string NearValid::Spoil(std::string text) {
    if (!OneIn(4) || text.empty()) {
        return text;
    }
    const std::size_t at = Below(text.size());
    switch (Below(8)) {
        case 0:
            return text.substr(0, at);
        case 1:
            return "\xEF\xBB\xBF" + text;
        case 2:
            return text + std::string(OneOf(kTails));
        case 3:
            return text.erase(at, 1);
        case 4:
            return text.insert(at, OneOf(kTails));
        case 5:
            return text.insert(at, OneOf(kPieces));
        case 6: {
            const std::size_t depth = OneIn(2) ? 10 + Below(12) : 250 + Below(12);
            return std::string(depth, '[') + text + std::string(depth, ']');
        }
        default:
            text[at] = static_cast<char>(Below(256));
            return text;
    }
}

std::string NearValid::Queue() {
    std::string text;
    for (std::size_t left = Below(8); left > 0; --left) {
        text += QueueLine() + '\n';
    }
    return text.substr(0, text.size() - (!text.empty() && OneIn(3) ? 1 : 0));
}

}  // namespace fileindex_fuzz
