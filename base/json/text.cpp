#include "base/json/text.h"

#include "base/has_nul.h"
#include "base/json/elements.h"
#include "base/json/number.h"

#include <json/writer.h>

#include <algorithm>
#include <cmath>
#include <exception>

namespace VORK {

namespace {

std::unique_ptr<Json::CharReader> NewReader() {
    Json::CharReaderBuilder builder;
    builder["collectComments"] = false;
    builder["allowComments"] = false;
    builder["allowTrailingCommas"] = false;
    builder["strictRoot"] = false;  // a lone number or string is valid JSON
    builder["failIfExtra"] = true;
    builder["rejectDupKeys"] = false;
    builder["skipBom"] = false;                 // a byte-order mark is no part of JSON
    builder["stackLimit"] = kMaxJsonDepth + 1;  // a number or string counts as a level to the parser
    return std::unique_ptr<Json::CharReader>(builder.newCharReader());
}

bool IsDigit(char c) {
    return c >= '0' && c <= '9';
}

/// Refuses what the JSON library's parser lets pass: comments, which it skips in some places even if told not to;
/// a comma after the last member; numbers like "-", "007" and "1."; a NUL, at which it stops whatever follows;
/// arrays and objects nested too deeply, which it counts together with other values. All other faults are left to
/// it.
class DialectCheck {
public:
    explicit DialectCheck(std::string_view text) : rest_(text) {}

    bool Passes() {
        if (HasNul(rest_)) {
            return false;
        }
        char last = 0;  // the last character outside strings that is no blank
        while (!rest_.empty()) {
            const char c = rest_.front();
            if (c == '"') {
                SkipString();
            } else if (IsDigit(c) || c == '-') {
                if (!SkipNumber()) {
                    return false;
                }
            } else if (!TakeOther(c, last)) {
                return false;
            }
            last = c == ' ' || c == '\t' || c == '\n' || c == '\r' ? last : c;
        }
        return true;
    }

private:
    /// An unfinished one ends the text.
    void SkipString() {
        rest_.remove_prefix(1);
        for (;;) {
            const std::size_t quote = rest_.find('"');
            const std::size_t escape = rest_.substr(0, quote).find('\\');
            if (escape == std::string_view::npos) {
                rest_.remove_prefix(std::min(quote, rest_.size() - 1) + 1);
                return;
            }
            rest_.remove_prefix(std::min(escape + 2, rest_.size()));
        }
    }

    bool SkipNumber() {
        const std::size_t length = NumberLength(rest_);
        rest_.remove_prefix(length);
        return length > 0;
    }

    bool TakeOther(char c, char last) {
        rest_.remove_prefix(1);
        switch (c) {
            case '/':
            case '+':
            case '.':
                return false;
            case '[':
            case '{':
                return ++depth_ <= kMaxJsonDepth;
            case ']':
            case '}':
                --depth_;
                return last != ',';
            default:
                return true;
        }
    }

    std::string_view rest_;
    int depth_ = 0;
};

bool IsNest(const Json::Value &value) {
    return value.isArray() || value.isObject();
}

bool NeedsEscape(char c) {
    return static_cast<unsigned char>(c) < 0x20 || c == '"' || c == '\\';
}

void AppendEscaped(std::string &out, char c) {
    switch (c) {
        case '"':
            out += "\\\"";
            return;
        case '\\':
            out += "\\\\";
            return;
        case '\b':
            out += "\\b";
            return;
        case '\f':
            out += "\\f";
            return;
        case '\n':
            out += "\\n";
            return;
        case '\r':
            out += "\\r";
            return;
        case '\t':
            out += "\\t";
            return;
        default: {
            constexpr char kHex[] = "0123456789abcdef";
            out += "\\u00";
            out += kHex[(c >> 4) & 0xF];
            out += kHex[c & 0xF];
        }
    }
}

/// `levels`: how many more of arrays and objects are written.
void Append(std::string &out, const Json::Value &value, int levels);

void AppendArray(std::string &out, const Json::Value &array, int levels) {
    char separator = '[';
    for (const Json::Value &element : Elements(array)) {
        out += separator;
        Append(out, element, levels);
        separator = ',';
    }
    out += array.empty() ? "[]" : "]";
}

void AppendObject(std::string &out, const Json::Value &object, int levels) {
    char separator = '{';
    for (auto member = object.begin(); member != object.end(); ++member) {
        char const *end = nullptr;
        const char *name = member.memberName(&end);
        out += separator;
        AppendQuoted(out, {name, static_cast<std::size_t>(end - name)});
        out += ':';
        Append(out, *member, levels);
        separator = ',';
    }
    out += object.empty() ? "{}" : "}";
}

void Append(std::string &out, const Json::Value &value, int levels) {
    if (IsNest(value) && levels == 0) {
        out += "...";
        return;
    }
    switch (value.type()) {
        case Json::nullValue:
            out += "null";
            return;
        case Json::intValue:
            out += std::to_string(value.asLargestInt());
            return;
        case Json::uintValue:
            out += std::to_string(value.asLargestUInt());
            return;
        case Json::realValue:
            out += Json::valueToString(value.asDouble());
            return;
        case Json::stringValue: {
            const char *begin = nullptr;
            const char *end = nullptr;
            value.getString(&begin, &end);
            AppendQuoted(out, {begin, static_cast<std::size_t>(end - begin)});
            return;
        }
        case Json::booleanValue:
            out += value.asBool() ? "true" : "false";
            return;
        case Json::arrayValue:
            AppendArray(out, value, levels - 1);
            return;
        case Json::objectValue:
            AppendObject(out, value, levels - 1);
            return;
    }
}

}  // namespace

JsonReader::JsonReader() : reader_(NewReader()) {}

bool JsonReader::Parse(std::string_view text, Json::Value &out) const {
    if (!DialectCheck(text).Passes()) {
        return false;
    }
    try {
        return reader_->parse(text.data(), text.data() + text.size(), &out, nullptr);
    } catch (const std::exception &) {
        return false;  // too deep, or a number beyond every range
    }
}

// Not the JSON library's writer: setting one up costs as much as sending the text it makes.
std::string ToString(const Json::Value &value) {
    std::string out;
    Append(out, value, kMaxJsonDepth);
    return out;
}

bool CanBeWritten(const Json::Value &value, int levels) {
    if (value.type() == Json::realValue) {
        return std::isfinite(value.asDouble());
    }
    return !IsNest(value) ||
           (levels < kMaxJsonDepth && std::all_of(value.begin(), value.end(), [&](const auto &inner) {
                return CanBeWritten(inner, levels + 1);
            }));
}

void AppendQuoted(std::string &out, std::string_view content) {
    out += '"';
    while (!content.empty()) {
        const auto escape = std::find_if(content.begin(), content.end(), NeedsEscape);
        out.append(content.begin(), escape);
        if (escape == content.end()) {
            break;
        }
        AppendEscaped(out, *escape);
        content.remove_prefix(static_cast<std::size_t>(escape - content.begin()) + 1);
    }
    out += '"';
}

}  // namespace VORK
