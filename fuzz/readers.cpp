// The fast readers of queue lines, queues and folder.conf against the exact one, and the writer of JSON against
// the JSON library's.
#include "base/json/text.h"
#include "base/metadata_entry.h"
#include "base/queue/event.h"
#include "checks.h"
#include "folders/folder_access.h"
#include "queue/pending.h"

#include <fileindex/folders.h>

#include <json/json.h>

#include <fcntl.h>

#include <algorithm>
#include <optional>
#include <sstream>
#include <utility>
#include <vector>

namespace fileindex_fuzz {

namespace {

using namespace VORK;
using namespace VORK::FILEINDEX;
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
    const Json::Value &path = record["path"];
    if (!path.isString() || !record.isMember("event") || !record["event"].isConvertibleTo(Json::uintValue)) {
        return {};
    }
    const Json::Value &oldPath = record["path_old"];
    return Event{record["event"].asUInt(), path.asString(), oldPath.isString() ? oldPath.asString() : ""};
}

Event Copy(const QueueEvent &event) {
    return {event.type, std::string(event.path), std::string(event.oldPath)};
}

/// Gives the text with nothing after it that could be read unnoticed.
class Alone {
public:
    explicit Alone(std::string_view text) : bytes_(text.begin(), text.end()) { bytes_.shrink_to_fit(); }
    std::string_view Text() const { return {bytes_.data(), bytes_.size()}; }

private:
    std::vector<char> bytes_;
};

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

/// Compares the lines of the file from `from` on with those that begin there or later.
void CheckLines(const std::vector<Line> &lines, off_t from, QueueLines read) {
    auto next = std::find_if(lines.begin(), lines.end(), [&](const Line &line) { return line.offset >= from; });
    QueueEventReader reader;
    for (QueueLine line; read.Next(line); ++next) {
        Require(next != lines.end(), "a line too many", line.text);
        Require(line.text == next->shown, "the line differs", line.text);
        Require(line.offset == next->offset, "the place differs", line.text);
        Require(line.passed || line.whole == next->whole, "the end differs", line.text);
        const QueueEvent *event = reader.Read(line);
        Require((event != nullptr) == next->event.has_value(), "the verdict differs", line.text);
        Require(event == nullptr || Copy(*event) == next->event, "the event differs", line.text);
    }
    Require(next == lines.end(), "a line is missing");
}

UniqueFd OpenFile(struct stat &status) {
    UniqueFd file = MetadataEntry(kFile).OpenFile(O_RDONLY, status);
    Require(static_cast<bool>(file), "cannot open");
    return file;
}

/// Writes the text and reads on from `position`, which has to end up after the last newline.
void CheckStep(QueuePosition &position, const std::string &text, bool first) {
    WriteWhole(kFile, text);
    struct stat status = {};
    UniqueFd file = OpenFile(status);
    Require(position.IsIn(status) != first, "another file");
    position = {status.st_dev, status.st_ino, position.offset};
    CheckLines(ReferenceLines(text), position.offset, QueueLines(std::move(file), position.offset));
    QueueLines lines(OpenFile(status), position.offset);
    for (QueueLine line; lines.Next(line);) {
    }
    position.offset = lines.AfterWhole();
    const auto behind = static_cast<off_t>(text.rfind('\n') + 1);  // 0 when there is none
    Require(position.offset == behind, "the place to go on from is wrong");
}

/// What begins at `end` or later is left out.
void CheckEnd(std::vector<Line> lines, off_t end) {
    std::erase_if(lines, [end](const Line &line) { return line.offset >= end; });
    struct stat status = {};
    CheckLines(lines, 0, QueueLines(OpenFile(status), 0, end));
}

void CheckFind(const std::vector<Line> &lines, const std::string &path) {
    const bool expected = std::any_of(lines.begin(), lines.end(), [&](const Line &line) {
        return line.event && line.event->type == kReindexEvent && line.event->path == path;
    });
    Require(IsReindexQueued(path, kFile) == expected, "the search answers otherwise", path);
}

void CheckEvent(std::string_view line) {
    const Alone alone(line);
    static QueueEventReader kept;  // what an earlier line left in it must not matter
    QueueEvent event = {0, "left", "over"};
    const bool decided = kept.ReadUsual(alone.Text(), event);
    Require(!decided || ReferenceEvent(line) == Copy(event), "the fast reader reads another event", line);
}

void CheckFolders(std::string_view text) {
    const Alone alone(text);
    Folders fast;
    if (!FolderAccess::TakeText(fast, alone.Text())) {
        Require(FolderAccess::All(fast).empty(), "something was taken", text);
        return;
    }
    Json::Value document;
    Require(JsonReader().Parse(text, document) && document.isObject(), "the fast reader accepts no object", text);
    Require(FolderAccess::All(fast).size() == document.size(), "the number of records differs", text);
    auto member = document.begin();
    for (const auto &[path, folder] : FolderAccess::All(fast)) {
        Require(member.name() == path, "the path differs", text);
        Folder exact;
        exact.Load(path, *member++);
        Require(folder.asJson() == exact.asJson(), "the record differs", text);
        Require(FolderAccess::StoredFullPath(folder) == FolderAccess::StoredFullPath(exact), "the place differs",
                text);
    }
}

void CheckWriter(std::string_view text) {
    Json::Value value;
    if (!JsonReader().Parse(text, value)) {
        return;
    }
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    builder["commentStyle"] = "None";
    Require(ToString(value) == Json::writeString(builder, value), "the JSON library writes otherwise", text);
}

void CheckQueue(const std::string &text, std::size_t cut) {
    QueuePosition position;
    CheckStep(position, text.substr(0, cut), true);
    CheckStep(position, text, false);
    const std::vector<Line> lines = ReferenceLines(text);
    CheckEnd(lines, QueueLines::kNoEnd);
    CheckEnd(lines, static_cast<off_t>(cut));
    constexpr std::size_t kSearches = 8;
    for (std::size_t i = 0; i < lines.size() && i < kSearches; ++i) {
        const Line &line = lines[i];
        CheckFind(lines, line.shown);
        CheckFind(lines, line.event ? line.event->path : "");
        CheckFind(lines, line.event ? line.event->path + "x" : "x");
    }
    CheckFind(lines, "");
}

}  // namespace

void FeedReaders(Input &input) {
    while (!input.IsEmpty()) {
        const std::string text = input.MaybeSpoilt(input.OneOf({"Q", "F", "D"}));
        CheckEvent(text);
        CheckFolders(text);
        CheckWriter(text);
    }
}

/// Every way of reading a queue against a plain one: whole, and in two steps with an end in between. One place may
/// be blown up to the reader's block or longest line; most inputs stay small, as a large one costs as much as a
/// thousand.
void FeedQueue(Input &input) {
    const std::size_t kind = input.Below(256);
    std::string text = input.MaybeSpoilt("M");
    const std::size_t least = (kind < 225 ? 0UL : kind < 254 ? 64UL : 1024UL) * 1024;
    const std::size_t filler = least == 0 ? 0 : least - 500 + input.Below(513);
    text.insert(input.Below(text.size() + 1), filler, kind % 2 == 0 ? 'x' : ' ');
    CheckQueue(text, input.Below(text.size() + 1));
}

}  // namespace fileindex_fuzz
