#include "queue_checks.h"

#include "json_checks.h"
#include "support.h"
#include "utils/queue_file.h"

#include <algorithm>
#include <fstream>
#include <functional>
#include <optional>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

namespace fileindex_fuzz {

namespace {

using namespace VORK::FILEINDEX::internal;  // NOLINT(google-build-using-namespace): the subject of every check

constexpr char kFile[] = "/tmp/queue";
constexpr std::size_t kLongest = 1024UL * 1024;
constexpr std::size_t kShown = 256;
constexpr unsigned kRename = 256;

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
        Line next = {line, tooLong ? std::nullopt : ReferenceEvent(line), !stream.eof(), offset};
        if (next.event && next.event->type != kRename) {
            next.event->oldPath.clear();
        }
        if (tooLong) {
            next.shown.resize(kShown);
        }
        lines.push_back(std::move(next));
    }
    return lines;
}

/// Compares what a scan visits with the lines that begin at `from` or later.
class Comparison {
public:
    Comparison(const std::vector<Line> &lines, off_t from) : lines_(lines) {
        while (next_ < lines_.size() && lines_[next_].offset < from) {
            ++next_;
        }
    }

    bool operator()(std::string_view line, const QueueEvent *event) {
        Require(next_ < lines_.size(), "a line too many", line);
        const Line &expected = lines_[next_++];
        Require(line == expected.shown, "the line differs", line);
        Require((event != nullptr) == expected.event.has_value(), "the verdict differs", line);
        if (event != nullptr) {
            Require(event->type == expected.event->type, "the event differs", line);
            Require(event->path == expected.event->path, "the path differs", line);
            Require(event->oldPath == expected.event->oldPath, "the old path differs", line);
            Require(event->whole == expected.whole, "the line's end differs", line);
            Require(event->offset == expected.offset, "the line's place differs", line);
        }
        return true;
    }

    void AtEnd() const { Require(next_ == lines_.size(), "a line is missing"); }

private:
    const std::vector<Line> &lines_;
    std::size_t next_ = 0;
};

void CheckStep(QueuePosition &position, const std::string &text, bool first) {
    const std::vector<Line> lines = ReferenceLines(text);
    Comparison comparison(lines, first ? 0 : position.offset);
    bool restarted = false;
    Require(ScanQueueFrom(
                kFile, position, [&] { restarted = true; }, std::ref(comparison)),
            "cannot scan on");
    comparison.AtEnd();
    Require(restarted == first, "began at the wrong place");
    const std::size_t newline = text.rfind('\n');
    const std::size_t behind = newline == std::string::npos ? 0 : newline + 1;
    Require(position.offset == static_cast<off_t>(behind), "the place to go on from is wrong");
}

bool IsIn(const std::vector<Line> &lines, unsigned type, const std::string &path) {
    return std::any_of(lines.begin(), lines.end(), [&](const Line &line) {
        return line.event && line.event->type == type && line.event->path == path;
    });
}

void CheckFind(const std::vector<Line> &lines, unsigned type, const std::string &path) {
    bool found = false;
    Require(FindInQueue(kFile, type, path, found), "cannot search");
    Require(found == IsIn(lines, type, path), "the search answers otherwise", path);
}

}  // namespace

void CheckQueue(std::string_view text, std::size_t cut) {
    const LeakCheck leaks;
    const std::string whole(text);
    WriteWhole(kFile, text.substr(0, cut));
    QueuePosition position;
    CheckStep(position, whole.substr(0, cut), true);
    std::ofstream(kFile, std::ios::binary | std::ios::app) << whole.substr(cut);
    CheckStep(position, whole, false);

    const std::vector<Line> lines = ReferenceLines(whole);
    Comparison comparison(lines, 0);
    Require(ScanQueue(kFile, std::ref(comparison)), "cannot scan");
    comparison.AtEnd();

    constexpr std::size_t kSearches = 8;
    for (std::size_t i = 0; i < lines.size() && i < kSearches; ++i) {
        const Line &line = lines[i];
        CheckFind(lines, 65536, line.shown);
        if (line.event) {
            CheckFind(lines, line.event->type, line.event->path);
            CheckFind(lines, 65536, line.event->path + "x");
            Require(IsInQueueAt(kFile, line.offset, line.event->type, line.event->path), "not at its place");
        } else {
            Require(!IsInQueueAt(kFile, line.offset, 65536, ""), "something malformed is found");
        }
    }
    CheckFind(lines, 65536, "");
}

}  // namespace fileindex_fuzz
