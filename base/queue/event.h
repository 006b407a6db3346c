/// \file
/// What the lines of an event queue say.
#pragma once

#include "base/json/text.h"
#include "base/queue/lines.h"

#include <json/value.h>

#include <optional>
#include <string>
#include <string_view>

namespace VORK {

// Types of events that have a name; the others tell what happened to a file.
inline constexpr unsigned kRenameEvent = 0x100;
inline constexpr unsigned kReindexEvent = 0x10000;
inline constexpr unsigned kSettingEvent = 0x20000;

struct QueueEvent {
    unsigned type = 0;
    std::string_view path{};     ///< full path
    std::string_view oldPath{};  ///< of a rename; empty when it is absent or not a string
};

/// Can be kept for many lines, which is faster.
class QueueEventReader {
public:
    /// Null when the line is malformed: well formed is an object with "event", convertible to unsigned, and
    /// "path", a string. The event and what it shows live until the next line is read.
    const QueueEvent *Read(const QueueLine &line);

    /// The "data" of a well-formed line, whatever it is; null when absent.
    Json::Value Data(const QueueLine &line);

    /// Reads the lines that are usually written, without making a document of them. False when it is not sure that
    /// the exact reader would read the same, which says nothing about the line; Read asks that reader then.
    bool ReadUsual(std::string_view line, QueueEvent &event);

private:
    const JsonReader &Exact();
    bool ReadExactly(std::string_view line);

    std::string decoded_;
    std::optional<JsonReader> exact_;
    Json::Value record_;
    QueueEvent event_;
};

}  // namespace VORK
