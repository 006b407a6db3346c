#include "base/json/text.h"
#include "checks.h"
#include "folders/folder_access.h"
#include "json/ordinary.h"
#include "names.h"
#include "queue/queue_file.h"

#include <json/json.h>

#include <algorithm>
#include <iterator>
#include <optional>
#include <sstream>
#include <vector>

namespace fileindex_fuzz {

namespace {

using namespace VORK;
using namespace VORK::FILEINDEX::internal;  // NOLINT(google-build-using-namespace): the subject of every check

constexpr char kFile[] = "/tmp/queue";
constexpr std::size_t kLongest = 1024UL * 1024;
constexpr std::size_t kShown = 256;

struct Event {
    unsigned type = 0;
    std::string path;
    std::string oldPath;

    bool operator==(const Event &) const = default;
};

/// A well-formed queue line, read by the rules alone.
std::optional<Event> ReferenceEvent(std::string_view line) {
    Json::Value record;
    if (!JsonReader().Parse(line, record) || !record.isObject()) {
        return {};
    }
    const Json::Value &path = record[kPathKey];
    if (!path.isString() || !record.isMember(kEventKey) || !record[kEventKey].isConvertibleTo(Json::uintValue)) {
        return {};
    }
    const Json::Value &oldPath = record[kOldPathKey];
    return Event{record[kEventKey].asUInt(), path.asString(), oldPath.isString() ? oldPath.asString() : ""};
}

bool EventAgrees(OrdinaryReader &reader, std::string_view line) {
    OrdinaryEvent fast;
    fast.oldPath = "left over";
    if (!reader.ReadEvent(line, fast)) {
        return false;
    }
    const Event event = {fast.type, std::string(fast.path), std::string(fast.oldPath)};
    Require(ReferenceEvent(line) == event, "the fast reader reads another event", line);
    return true;
}

bool FoldersAgree(OrdinaryReader &reader, std::string_view text) {
    std::vector<FolderRecord> records;
    if (!reader.ReadFolders(text, records)) {
        return false;
    }
    Json::Value document;
    Require(JsonReader().Parse(text, document) && document.isObject(), "the fast reader accepts no object", text);
    Require(records.size() == document.size(), "the number of records differs", text);
    auto member = document.begin();
    for (const FolderRecord &record : records) {
        Require(member.name() == record.path, "the path differs", text);
        VORK::FILEINDEX::Folder folder;
        folder.Load(std::string(record.path), *member++);
        Require(folder.name == (record.hasName ? record.name : ""), "the name differs", text);
        for (std::size_t kind = 0; kind < std::size(record.flag); ++kind) {
            Require(folder.*kMediaFlags[kind] == (record.hasFlag[kind] && record.flag[kind]), "a flag differs",
                    text);
        }
    }
    return true;
}

/// Gives the text with nothing behind it but the promised bytes, which are of the worst kind: they continue it.
/// What an earlier text left in a reader must not matter.
bool Compare(bool (*agrees)(OrdinaryReader &, std::string_view), std::string_view text) {
    constexpr std::string_view kMore = "\"}]0e1,";
    std::vector<char> bytes(text.size() + OrdinaryReader::kPadding);
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        bytes[i] = i < text.size() ? text[i] : kMore[i % kMore.size()];
    }
    const std::string_view padded(bytes.data(), text.size());
    static OrdinaryReader kept;
    OrdinaryReader fresh;
    const bool decided = agrees(fresh, padded);
    Require(agrees(kept, padded) == decided, "an earlier text matters", text);
    return decided;
}

struct Line {
    std::string shown;
    std::optional<Event> event;
    bool whole = true;
    off_t offset = 0;
};

std::vector<Line> ReferenceLines(const std::string &text) {
    std::vector<Line> lines;
    std::istringstream stream(text);
    off_t offset = 0;
    for (std::string line; std::getline(stream, line); offset += static_cast<off_t>(line.size()) + 1) {
        const bool tooLong = line.size() > kLongest;
        Line &next = lines.emplace_back(Line{line, {}, !stream.eof(), offset});
        next.event = tooLong ? std::nullopt : ReferenceEvent(line);
        if (next.event && next.event->type != kRenameEvent) {
            next.event->oldPath.clear();
        }
        next.shown.resize(tooLong ? kShown : line.size());
    }
    return lines;
}

/// Compares what a scan visits with the lines that begin at `from` or later.
template <typename Scan>
void CheckScan(const std::vector<Line> &lines, off_t from, Scan scan) {
    auto next = std::find_if(lines.begin(), lines.end(), [&](const Line &line) { return line.offset >= from; });
    const QueueVisitor visit = [&](std::string_view line, const QueueEvent *event) {
        Require(next != lines.end(), "a line too many", line);
        Require(line == next->shown, "the line differs", line);
        Require((event != nullptr) == next->event.has_value(), "the verdict differs", line);
        if (event != nullptr) {
            const Event read = {event->type, std::string(event->path), std::string(event->oldPath)};
            Require(read == next->event, "the event differs", line);
            Require(event->whole == next->whole && event->offset == next->offset, "the place differs", line);
        }
        ++next;
        return true;
    };
    Require(scan(visit), "cannot scan");
    Require(next == lines.end(), "a line is missing");
}

/// Writes the text and scans on from `position`, which has to end up behind the last newline.
void CheckStep(QueuePosition &position, const std::string &text, bool first) {
    WriteWhole(kFile, text);
    bool restarted = false;
    CheckScan(ReferenceLines(text), position.offset, [&](const QueueVisitor &visit) {
        return ScanQueueFrom(
            kFile, position, [&] { restarted = true; }, visit);
    });
    Require(restarted == first, "began at the wrong place");
    const auto behind = static_cast<off_t>(text.rfind('\n') + 1);  // 0 when there is none
    Require(position.offset == behind, "the place to go on from is wrong");
}

void CheckFind(const std::vector<Line> &lines, unsigned type, const std::string &path) {
    const bool expected = std::any_of(lines.begin(), lines.end(), [&](const Line &line) {
        return line.event && line.event->type == type && line.event->path == path;
    });
    bool found = false;
    Require(FindInQueue(kFile, type, path, found), "cannot search");
    Require(found == expected, "the search answers otherwise", path);
}

}  // namespace

bool CheckEvent(std::string_view line) {
    return Compare(EventAgrees, line);
}

bool CheckFolders(std::string_view text) {
    return Compare(FoldersAgree, text);
}

bool CheckWriter(std::string_view text) {
    Json::Value value;
    if (!JsonReader().Parse(text, value)) {
        return false;
    }
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    builder["commentStyle"] = "None";
    Require(ToString(value) == Json::writeString(builder, value), "the JSON library writes otherwise", text);
    return true;
}

void CheckQueue(const std::string &text, std::size_t cut) {
    QueuePosition position;
    CheckStep(position, text.substr(0, cut), true);
    CheckStep(position, text, false);
    const std::vector<Line> lines = ReferenceLines(text);
    CheckScan(lines, 0, [](const QueueVisitor &visit) { return ScanQueue(kFile, visit); });
    constexpr std::size_t kSearches = 8;
    for (std::size_t i = 0; i < lines.size() && i < kSearches; ++i) {
        const Line &line = lines[i];
        const Event event = line.event.value_or(Event{kReindexEvent, "", ""});
        CheckFind(lines, kReindexEvent, line.shown);
        CheckFind(lines, event.type, event.path);
        CheckFind(lines, kReindexEvent, event.path + "x");
        Require(IsInQueueAt(kFile, line.offset, event.type, event.path) == line.event.has_value(), "at its place",
                line.shown);
    }
    CheckFind(lines, kReindexEvent, "");
}

}  // namespace fileindex_fuzz
