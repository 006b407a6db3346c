#include "json/ordinary.h"

#include "json/compact_event.h"
#include "names.h"

#include <simdjson.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <iterator>
#include <limits>
#include <thread>

namespace VORK::FILEINDEX::internal {

namespace {

using simdjson::dom::element;
using simdjson::dom::element_type;
using simdjson::dom::object;

constexpr std::size_t kMaxDepth = 16;     // far below the exact reader's limit
constexpr std::size_t kMinCapacity = 64;  // with less, parsing allocates by itself

/// The two readers may differ about halves of surrogate pairs. One search settles it for most texts.
bool MayHaveSurrogates(std::string_view text) {
    return text.find('\\') != std::string_view::npos &&
           (text.find("\\ud") != std::string_view::npos || text.find("\\uD") != std::string_view::npos);
}

/// Both readers accept it: far from the ends of the range, where one of them may give up.
bool IsPlainReal(double value) {
    constexpr double kLargest = 1e300;
    const double magnitude = std::abs(value);
    return magnitude < kLargest && magnitude > 1 / kLargest;
}

bool IsPlain(const element &value) {
    switch (value.type()) {
        case element_type::DOUBLE:
            return IsPlainReal(value.get_double().value_unsafe());
        case element_type::ARRAY:
            for (const element child : simdjson::dom::array(value.get_array().value_unsafe())) {
                if (!IsPlain(child)) {
                    return false;
                }
            }
            return true;
        case element_type::OBJECT:
            for (const auto member : object(value.get_object().value_unsafe())) {
                if (!IsPlain(member.value)) {
                    return false;
                }
            }
            return true;
        default:
            return true;
    }
}

int MediaKindOf(std::string_view key) {
    for (std::size_t kind = 0; kind < std::size(kMediaKeys); ++kind) {
        if (key == kMediaKeys[kind]) {
            return static_cast<int>(kind);
        }
    }
    return -1;
}

/// False when a member that counts is repeated or any member is a real, an array or an object.
bool ReadRecord(const object &members, FolderRecord &record) {
    bool nameSeen = false;
    bool flagSeen[std::size(kMediaKeys)] = {};
    for (const auto member : members) {
        const element_type type = member.value.type();
        if (type == element_type::DOUBLE || type == element_type::ARRAY || type == element_type::OBJECT) {
            return false;
        }
        const int kind = MediaKindOf(member.key);
        bool *const seen = kind >= 0 ? &flagSeen[kind] : member.key == kNameKey ? &nameSeen : nullptr;
        if (seen == nullptr) {
            continue;
        }
        if (*seen) {
            return false;
        }
        *seen = true;
        if (kind >= 0) {
            record.hasFlag[kind] = member.value.get_bool().get(record.flag[kind]) == simdjson::SUCCESS;
        } else {
            record.hasName = member.value.get_string().get(record.name) == simdjson::SUCCESS;
        }
    }
    return true;
}

/// Set while the process ends, when the JSON library's own objects are about to be destroyed.
constinit std::atomic<bool> isEnding = false;

/// How many threads use these objects just now.
constinit std::atomic<int> users = 0;

struct AtExit {
    AtExit() = default;
    AtExit(const AtExit &) = delete;
    AtExit &operator=(const AtExit &) = delete;

    /// Waits for a thread in the middle of its use. Not for ever: after a fork it may have stayed in the parent.
    ~AtExit() {
        isEnding = true;
        for (int pauses = 0; users != 0 && pauses < 100; ++pauses) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
    }
};

/// When the library is loaded, and so before the host can register anything that asks us at exit: the JSON library
/// makes its objects now, and they are destroyed after all that is made or registered later. The first of these is
/// the mark for who asks nevertheless: a thread that outlives main, or a handler registered still earlier.
[[gnu::constructor]] void ChooseInstructions() {
    // Chosen by us: left alone, the JSON library would ask an environment variable which instructions to use.
    simdjson::get_active_implementation() = simdjson::get_available_implementations().detect_best_supported();
    static const AtExit mark;
}

}  // namespace

struct OrdinaryReader::Parser {
    simdjson::dom::parser parser;

    /// The text's top-level object; it is kept in the parser until the next text.
    bool Parse(std::string_view text, object &root) {
        return !text.empty() && !MayHaveSurrogates(text) && HasRoomFor(text.size()) &&
               parser.parse(text.data(), text.size(), false).get_object().get(root) == simdjson::SUCCESS;
    }

private:
    /// Allocates ahead of need, so that slowly growing lines do not allocate each time.
    bool HasRoomFor(std::size_t size) {
        return size <= parser.capacity() || Allocate(std::max({size, kMinCapacity, 2 * parser.capacity()}));
    }

    /// The one place that asks an object of the JSON library's own; a parser that is made does without them.
    bool Allocate(std::size_t size) {
        ++users;
        const bool done = !isEnding && parser.allocate(size, kMaxDepth) == simdjson::SUCCESS;
        --users;
        return done;
    }
};

OrdinaryReader::OrdinaryReader() : parser_(std::make_unique<Parser>()) {}

OrdinaryReader::~OrdinaryReader() = default;

bool OrdinaryReader::ReadEvent(std::string_view line, OrdinaryEvent &event) {
    if (ReadCompactEvent(line, event)) {
        return true;
    }
    object root;
    if (!parser_->Parse(line, root)) {
        return false;
    }
    // Of repeated members the last one counts, whatever the others are.
    std::uint64_t type = 0;
    bool hasType = false;
    bool hasPath = false;
    event.oldPath = {};
    for (const auto member : root) {
        if (!IsPlain(member.value)) {
            return false;
        }
        if (member.key == kEventKey) {
            hasType = member.value.get_uint64().get(type) == simdjson::SUCCESS;
        } else if (member.key == kPathKey) {
            hasPath = member.value.get_string().get(event.path) == simdjson::SUCCESS;
        } else if (member.key == kOldPathKey) {
            const bool isText = member.value.get_string().get(event.oldPath) == simdjson::SUCCESS;
            event.oldPath = isText ? event.oldPath : std::string_view();
        }
    }
    event.type = static_cast<unsigned>(type);
    return hasType && hasPath && type <= std::numeric_limits<unsigned>::max();
}

bool OrdinaryReader::ReadFolders(std::string_view text, std::vector<FolderRecord> &records) {
    object root;
    if (!parser_->Parse(text, root)) {
        return false;
    }
    for (const auto member : root) {
        object members;
        FolderRecord record;
        record.path = member.key;
        const bool sorted = records.empty() || records.back().path < record.path;
        if (!sorted || member.value.get_object().get(members) != simdjson::SUCCESS ||
            !ReadRecord(members, record)) {
            return false;
        }
        records.push_back(record);
    }
    return true;
}

}  // namespace VORK::FILEINDEX::internal
