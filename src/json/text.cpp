#include "json/text.h"

#include "json/elements.h"

#include <json/writer.h>

#include <algorithm>
#include <exception>

namespace VORK::FILEINDEX::internal {

namespace {

// Deeper documents have no use here, and a hostile one must not exhaust the stack.
constexpr int kMaxDepth = 256;

std::unique_ptr<Json::CharReader> NewReader() {
    Json::CharReaderBuilder builder;
    builder["collectComments"] = false;
    builder["allowComments"] = false;
    builder["allowTrailingCommas"] = false;
    builder["strictRoot"] = false;  // a lone number or string is valid JSON
    builder["failIfExtra"] = true;
    builder["rejectDupKeys"] = false;
    builder["stackLimit"] = kMaxDepth + 1;  // a number or string counts as a level to the parser
    return std::unique_ptr<Json::CharReader>(builder.newCharReader());
}

/// Too few brackets to nest too deep, no NUL, and a member's first character right behind each comma: settles most
/// texts in one pass without looking at their structure. False: look closer.
bool IsPlainlyWithinDialect(std::string_view text) {
    int openers = 0;
    bool suspect = false;
    char last = 0;
    for (const char c : text) {
        openers += (c | 0x20) == '{' ? 1 : 0;  // '[' too
        suspect |= c == '\0' || (last == ',' && (c == ']' || c == '}' || static_cast<unsigned char>(c) <= ' '));
        last = c;
    }
    return !suspect && openers <= kMaxDepth;
}

/// Sees to what the parser is lenient about: a NUL ends its text whatever follows, and a comma may trail a member
/// without a name. Counts arrays and objects, which the parser cannot tell from other values.
bool IsWithinDialect(std::string_view text) {
    int depth = 0;
    bool inString = false;
    char last = 0;  // the last character that is no blank; one inside a string is followed by its quote
    for (std::size_t i = 0; i < text.size(); ++i) {
        const char c = text[i];
        if (c == '\0') {
            return false;
        }
        if (inString) {
            i += c == '\\' ? 1 : 0;
            inString = c != '"';
        } else if (c == '"') {
            inString = true;
        } else if (c == '[' || c == '{') {
            if (++depth > kMaxDepth) {
                return false;
            }
        } else if (c == ']' || c == '}') {
            if (last == ',') {
                return false;
            }
            --depth;
        }
        if (c != ' ' && c != '\t' && c != '\n' && c != '\r') {
            last = c;
        }
    }
    return true;
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

void Append(std::string &out, const Json::Value &value);

void AppendArray(std::string &out, const Json::Value &array) {
    char separator = '[';
    for (const Json::Value &element : Elements(array)) {
        out += separator;
        Append(out, element);
        separator = ',';
    }
    out += array.empty() ? "[]" : "]";
}

void AppendObject(std::string &out, const Json::Value &object) {
    char separator = '{';
    for (auto member = object.begin(); member != object.end(); ++member) {
        char const *end = nullptr;
        const char *name = member.memberName(&end);
        out += separator;
        AppendQuoted(out, {name, static_cast<std::size_t>(end - name)});
        out += ':';
        Append(out, *member);
        separator = ',';
    }
    out += object.empty() ? "{}" : "}";
}

void Append(std::string &out, const Json::Value &value) {
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
            AppendArray(out, value);
            return;
        case Json::objectValue:
            AppendObject(out, value);
            return;
    }
}

}  // namespace

JsonReader::JsonReader() : reader_(NewReader()) {}

bool JsonReader::Parse(std::string_view text, Json::Value &out) const {
    if (!IsPlainlyWithinDialect(text) && !IsWithinDialect(text)) {
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
    Append(out, value);
    return out;
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

}  // namespace VORK::FILEINDEX::internal
