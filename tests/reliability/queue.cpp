// Eight writers of one event queue, and a consumer that renames it away all the time.
#include "harness.h"
#include "scenarios.h"
#include "support/syslog_capture.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/resource.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <cstdio>
#include <fstream>
#include <map>

namespace reliability {

namespace {

using namespace VORK::FILEINDEX;
using fileindex_test::SyslogCapture;

constexpr int kWriters = 8;
constexpr int kMaxEvents = 40000;
constexpr int kReindex = 0x10000;
constexpr int kSetting = 0x20000;
constexpr int kSharedPaths = 4;

enum class Outcome { kNone, kTrue, kDropped, kFalse };

struct Event {
    Outcome outcome = Outcome::kNone;
    double begin = 0;
    double end = 0;
};

struct Board {
    std::array<Event, kMaxEvents> events;
    std::atomic<int> writing = kWriters;
};

double Now() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

/// One event in ten is for a path that others queue events for as well, and half of those are reindexes.
bool IsShared(int number) {
    return number % 10 == 0;
}

bool IsReindex(int number) {
    return number % 20 == 0;
}

std::string PathOf(int number) {
    return IsShared(number) ? "/vol1/photo/shared " + std::to_string(number / 20 % kSharedPaths)
                            : "/vol1/photo/" + std::to_string(number);
}

/// The lock stayed busy for three attempts: told by a record that only the debug level writes.
bool WasDropped() {
    for (const auto &record : SyslogCapture::Records()) {
        if (record.message.find("try lock too many times") == 0) {
            return true;
        }
    }
    return false;
}

void WriteEvents(Board &board, int writer, int count) {
    LOG_LEVEL = 7;
    for (int number = writer; number < count; number += kWriters) {
        SyslogCapture::Clear();
        Event &event = board.events[number];
        event.begin = Now();
        const bool queued =
            AddCustomEvent(IsReindex(number) ? kReindex : kSetting, PathOf(number), Json::Value(number));
        event.end = Now();
        event.outcome = !queued ? Outcome::kFalse : WasDropped() ? Outcome::kDropped : Outcome::kTrue;
    }
    --board.writing;
}

/// What came out of the queue: each event's number, and when its line was gone.
using Consumed = std::map<int, double>;

void KeepLine(const std::string &line, double gone, Consumed &consumed) {
    const auto record = Parse(line);
    Check(record && record->isObject() && (*record)["data"].isInt(), "a line in pieces: " + line);
    const int number = (*record)["data"].asInt();
    const int type = IsReindex(number) ? kReindex : kSetting;
    Check((*record)["path"] == PathOf(number) && (*record)["event"] == type, "a line of two events: " + line);
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
    std::ifstream file(taken);
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);) {
        Check(!file.eof(), "a line without its end: " + line);
        lines.push_back(line);
    }
    ::unlink(taken.c_str());
    ::close(fd);
    const double gone = Now();
    for (const std::string &line : lines) {
        KeepLine(line, gone, consumed);
    }
    return true;
}

/// Was a reindex of the event's path waiting at some moment of its call?
bool IsCovered(int number, const Board &board, const Consumed &consumed) {
    const Event &event = board.events[number];
    for (const auto &[other, gone] : consumed) {
        if (IsReindex(other) && PathOf(other) == PathOf(number) && gone >= event.begin &&
            board.events[other].begin <= event.end) {
            return true;
        }
    }
    return false;
}

struct Totals {
    int lines = 0;
    int dropped = 0;
    int duplicates = 0;
    int refused = 0;
};

Totals Account(const Board &board, const Consumed &consumed, int count) {
    Totals totals;
    for (int number = 0; number < count; ++number) {
        const bool came = consumed.contains(number);
        const Outcome outcome = board.events[number].outcome;
        totals.lines += came ? 1 : 0;
        totals.refused += outcome == Outcome::kFalse ? 1 : 0;
        totals.dropped += outcome == Outcome::kDropped ? 1 : 0;
        Check(outcome == Outcome::kTrue || !came, "an event came that was refused or dropped");
        if (outcome == Outcome::kTrue && !came) {
            Check(IsShared(number) && IsCovered(number, board, consumed),
                  "an event is lost: " + std::to_string(number));
            ++totals.duplicates;
        }
    }
    return totals;
}

}  // namespace

void QueueWriters() {
    MakeMachine();
    const int count = Rounds(4000, kMaxEvents);
    auto &board = Shared<Board>();
    std::vector<pid_t> writers;
    writers.reserve(kWriters);
    for (int writer = 0; writer < kWriters; ++writer) {
        writers.push_back(Start([&board, writer, count] { WriteEvents(board, writer, count); }));
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
    const Totals totals = Account(board, consumed, count);
    Check(totals.refused == 0 || StatusMgr::ShareIsNeedReindex("photo"), "refused, and the share is not marked");
    Check(totals.duplicates > 0, "no duplicate was ever left out");
    Figure("8 queue writers, " + std::to_string(renames) + " renames by the consumer",
           std::to_string(count) + " events: " + std::to_string(totals.lines) + " whole lines, " +
               std::to_string(totals.duplicates) + " duplicates, " + std::to_string(totals.dropped) +
               " dropped, " + std::to_string(totals.refused) + " refused and marked, 0 lost");
}

}  // namespace reliability
