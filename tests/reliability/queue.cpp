// Eight writers of one event queue, and a consumer that renames it away all the time.
#include "harness.h"
#include "support/syslog_capture.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/resource.h>

#include <algorithm>
#include <map>
#include <sstream>

namespace reliability {

namespace {

using fileindex_test::SyslogCapture;

constexpr int kWriters = 8;
constexpr int kMaxEvents = 40000;

enum Outcome { kFalse, kDropped, kTrue, kOutcomes };

struct Event {
    Outcome outcome = kFalse;
    double begin = 0;
    double end = 0;
};

struct Board {
    std::array<Event, kMaxEvents> events;
    std::atomic<int> writing = kWriters;
};

/// One event in ten is for a path that others queue events for as well, and half of those are reindexes.
bool IsShared(int number) {
    return number % 10 == 0;
}

int TypeOf(int number) {
    return number % 20 == 0 ? 0x10000 : 0x20000;
}

std::string PathOf(int number) {
    return "/vol1/photo/" +
           (IsShared(number) ? "shared " + std::to_string(number / 20 % 4) : std::to_string(number));
}

/// The lock stayed busy for three attempts: told by a record that only the debug level writes.
bool WasDropped() {
    const auto records = SyslogCapture::Records();
    return std::any_of(records.begin(), records.end(),
                       [](const auto &record) { return record.message.starts_with("try lock too many times"); });
}

void WriteEvents(Board &board, int writer, int count) {
    LOG_LEVEL = 7;
    for (int number = writer; number < count; number += kWriters) {
        SyslogCapture::Clear();
        Event &event = board.events[number];
        event.begin = Now();
        const bool queued = AddCustomEvent(TypeOf(number), PathOf(number), Json::Value(number));
        event.end = Now();
        event.outcome = !queued ? kFalse : WasDropped() ? kDropped : kTrue;
    }
    --board.writing;
}

/// What came out of the queue: each event's number, and when its line was gone.
using Consumed = std::map<int, double>;

void KeepLine(const std::string &line, double gone, Consumed &consumed) {
    const auto record = Parse(line);
    Check(record && record->isObject() && (*record)["data"].isInt(), "a line in pieces: " + line);
    const int number = (*record)["data"].asInt();
    Check((*record)["path"] == PathOf(number) && (*record)["event"] == TypeOf(number),
          "a line of two events: " + line);
    Check(consumed.emplace(number, gone).second, "an event came twice: " + line);
}

/// As the daemon does: takes the file away, waits for a writer that may still have it, reads it. False without
/// one.
bool ConsumeOnce(Consumed &consumed) {
    const std::string taken = std::string(kQueue) + ".tmp";
    if (::rename(kQueue, taken.c_str()) != 0) {
        return false;
    }
    const int fd = ::open(taken.c_str(), O_RDONLY | O_CLOEXEC);
    Check(fd >= 0 && ::flock(fd, LOCK_EX) == 0, "take the queue");
    std::istringstream lines(ReadFile(taken));
    ::unlink(taken.c_str());
    ::close(fd);
    const double gone = Now();
    for (std::string line; std::getline(lines, line);) {
        Check(!lines.eof(), "a line without its end: " + line);
        KeepLine(line, gone, consumed);
    }
    return true;
}

/// Was a reindex of the event's path waiting at some moment of its call?
bool IsCovered(int number, const Board &board, const Consumed &consumed) {
    const Event &event = board.events[number];
    return std::any_of(consumed.begin(), consumed.end(), [&](const auto &line) {
        const auto &[other, gone] = line;
        return TypeOf(other) == TypeOf(0) && PathOf(other) == PathOf(number) && gone >= event.begin &&
               board.events[other].begin <= event.end;
    });
}

}  // namespace

void QueueWriters(const std::string &) {
    MakeMachine();
    const int count = Rounds(4000, kMaxEvents);
    auto &board = Shared<Board>();
    std::array<pid_t, kWriters> writers{};
    for (int writer = 0; writer < kWriters; ++writer) {
        writers[writer] = Start([&board, writer, count] { WriteEvents(board, writer, count); });
    }
    Consumed consumed;
    int renames = 0;
    ::setpriority(PRIO_PROCESS, 0, -20);  // or the writers would hardly ever meet a rename
    while (board.writing > 0) {
        renames += ConsumeOnce(consumed) ? 1 : 0;
    }
    for (const pid_t writer : writers) {
        Check(Wait(writer) == 0, "a writer failed");
    }
    ConsumeOnce(consumed);

    std::array<int, kOutcomes> totals{};
    for (int number = 0; number < count; ++number) {
        const Outcome outcome = board.events[number].outcome;
        ++totals[outcome];
        const bool came = consumed.contains(number);
        Check(outcome == kTrue || !came, "an event came that was refused or dropped");
        Check(outcome != kTrue || came || (IsShared(number) && IsCovered(number, board, consumed)),
              "an event is lost: " + std::to_string(number));
    }
    const int lines = static_cast<int>(consumed.size());
    Check(totals[kFalse] == 0 || StatusMgr::ShareIsNeedReindex("photo"), "refused, and the share is not marked");
    Check(totals[kTrue] > lines, "no duplicate was ever left out");
    Figure(
        "8 queue writers, %d renames by the consumer | %d events: %d whole lines, %d duplicates, %d dropped,"
        " %d refused and marked, 0 lost",
        renames, count, lines, totals[kTrue] - lines, totals[kDropped], totals[kFalse]);
}

}  // namespace reliability
