#include "base/queue/event.h"

#include "base/json/scanner.h"

#include <charconv>
#include <cstddef>
#include <cstring>
#include <system_error>

namespace VORK {

namespace {

constexpr char kEventKey[] = "event";
constexpr char kPathKey[] = "path";
constexpr char kOldPathKey[] = "path_old";

/// Takes what it recognises off the front of a text.
class Cursor {
public:
    explicit Cursor(std::string_view text) : rest_(text) {}

    bool Take(std::string_view literal) {
        if (!rest_.starts_with(literal)) {
            return false;
        }
        rest_.remove_prefix(literal.size());
        return true;
    }

    bool TakeBool() { return Take("true") || Take("false"); }

    /// The data of an event: nothing, or what has changed for each media kind.
    bool TakeData() {
        return Take("null") ||
               (Take("{\"audio\":") && TakeBool() && Take(",\"document\":") && TakeBool() && Take(",\"photo\":") &&
                TakeBool() && Take(",\"video\":") && TakeBool() && Take("}"));
    }

    bool TakeUnsigned(unsigned &value) {
        const char *end = rest_.data() + rest_.size();
        const auto [after, error] = std::from_chars(rest_.data(), end, value);
        const auto length = static_cast<std::size_t>(after - rest_.data());
        if (error != std::errc() || (length > 1 && rest_.front() == '0')) {
            return false;
        }
        rest_.remove_prefix(length);
        return true;
    }

    /// A string's content up to its closing quote, which is taken too; its opening one has been.
    bool TakeString(std::string_view &content) {
        const std::size_t end = rest_.find('"');
        if (end == std::string_view::npos) {
            return false;
        }
        content = rest_.substr(0, end);
        rest_.remove_prefix(end + 1);
        // After a backslash the quote may belong to the string; a NUL is nowhere allowed.
        return std::memchr(content.data(), '\\', end) == nullptr &&
               std::memchr(content.data(), '\0', end) == nullptr;
    }

    bool AtEnd() const { return rest_.empty(); }

private:
    std::string_view rest_;
};

/// Recognises a line as the library writes it, byte for byte. Nearly all lines are like it, and such a one is read
/// twice as fast as by the scanner:
///
///     {"data":null,"event":65536,"path":"/vol1/photo"}
bool ReadWritten(std::string_view line, QueueEvent &event) {
    Cursor cursor(line);
    if (!cursor.Take("{") || (cursor.Take("\"data\":") && !(cursor.TakeData() && cursor.Take(",")))) {
        return false;
    }
    if (!cursor.Take("\"event\":") || !cursor.TakeUnsigned(event.type) || !cursor.Take(",\"path\":\"") ||
        !cursor.TakeString(event.path)) {
        return false;
    }
    event.oldPath = {};
    if (cursor.Take(",\"path_old\":\"") && !cursor.TakeString(event.oldPath)) {
        return false;
    }
    return cursor.Take("}") && cursor.AtEnd();
}

const Json::Value *Member(const Json::Value &record, std::string_view key) {
    return record.find(key.data(), key.data() + key.size());
}

/// Empty when the member is absent or not a string.
std::optional<std::string_view> Text(const Json::Value &record, std::string_view key) {
    const Json::Value *member = Member(record, key);
    char const *begin = nullptr;
    char const *end = nullptr;
    if (member == nullptr || !member->getString(&begin, &end)) {
        return std::nullopt;
    }
    return std::string_view(begin, static_cast<std::size_t>(end - begin));
}

}  // namespace

const QueueEvent *QueueEventReader::Read(const QueueLine &line) {
    if (line.passed || (!ReadUsual(line.text, event_) && !ReadExactly(line.text))) {
        return nullptr;
    }
    if (event_.type != kRenameEvent) {
        event_.oldPath = {};
    }
    return &event_;
}

Json::Value QueueEventReader::Data(const QueueLine &line) {
    Json::Value record;
    return Exact().Parse(line.text, record) && record.isObject() ? record["data"] : Json::Value();
}

bool QueueEventReader::ReadUsual(std::string_view line, QueueEvent &event) {
    if (ReadWritten(line, event)) {
        return true;
    }
    event = {};
    bool hasType = false;
    bool hasPath = false;
    JsonScanner json(line, decoded_);
    return json.TakeObject([&](std::string_view name) {
        if (name == kEventKey) {
            return hasType = json.TakeUnsigned(event.type);
        }
        if (name == kPathKey) {
            return hasPath = json.TakeString(event.path);
        }
        return name == kOldPathKey ? json.TakeString(event.oldPath) : json.Skip();
    }) && json.AtEnd() &&
           hasType && hasPath;
}

const JsonReader &QueueEventReader::Exact() {
    return exact_ ? *exact_ : exact_.emplace();
}

bool QueueEventReader::ReadExactly(std::string_view line) {
    if (!Exact().Parse(line, record_) || !record_.isObject()) {
        return false;
    }
    const Json::Value *type = Member(record_, kEventKey);
    const auto path = Text(record_, kPathKey);
    if (type == nullptr || !type->isConvertibleTo(Json::uintValue) || !path) {
        return false;
    }
    event_ = {type->asUInt(), *path, Text(record_, kOldPathKey).value_or("")};
    return true;
}

}  // namespace VORK
