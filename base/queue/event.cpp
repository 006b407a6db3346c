#include "base/queue/event.h"

#include "base/json/scanner.h"

#include <cstddef>

namespace VORK {

namespace {

constexpr char kEventKey[] = "event";
constexpr char kPathKey[] = "path";
constexpr char kOldPathKey[] = "path_old";

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
