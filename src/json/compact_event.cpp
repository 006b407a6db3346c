#include "json/compact_event.h"

#include "json/ordinary.h"

#include <charconv>
#include <cstddef>
#include <cstring>
#include <system_error>

namespace VORK::FILEINDEX::internal {

namespace {

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

    /// What other writers are informed of: nothing, or the four kinds.
    bool TakeData() {
        return Take("null") ||
               (Take("{\"audio\":") && TakeBool() && Take(",\"document\":") && TakeBool() && Take(",\"photo\":") &&
                TakeBool() && Take(",\"video\":") && TakeBool() && Take("}"));
    }

    bool TakeUnsigned(unsigned &value) {
        const char *end = rest_.data() + rest_.size();
        const auto [behind, error] = std::from_chars(rest_.data(), end, value);
        const auto length = static_cast<std::size_t>(behind - rest_.data());
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
        // Behind a backslash the quote may belong to the string; a NUL is nowhere allowed.
        return std::memchr(content.data(), '\\', end) == nullptr &&
               std::memchr(content.data(), '\0', end) == nullptr;
    }

    bool AtEnd() const { return rest_.empty(); }

private:
    std::string_view rest_;
};

}  // namespace

bool ReadCompactEvent(std::string_view line, OrdinaryEvent &event) {
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

}  // namespace VORK::FILEINDEX::internal
