/// \file
/// What a test tells the replaced functions to do, and the one journal they all write to.
///
/// The platform and several C functions are replaced in every unit test (platform.h, system_calls.cpp), all of
/// which run in one thread at a time. Each call is counted here, may be told to fail, and what it changes in the
/// world is one line of the journal.
#pragma once

#include <pthread.h>

#include <functional>
#include <limits>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace fileindex_test {

constexpr int kAlways = std::numeric_limits<int>::max();

/// What a replaced function does by itself, in the place of another process, is not cancelled.
struct NotCancelled {
    int before = 0;
    NotCancelled() { ::pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &before); }
    ~NotCancelled() { ::pthread_setcancelstate(before, nullptr); }
};

/// From the nth matching call on, `times` calls fail, or do something else first.
struct Fault {
    std::string call;                ///< the function's name
    std::string about = {};          ///< only calls whose name, path or descriptor's path holds this text
    int nth = 1;                     ///< counted from the moment the fault is given
    int times = 1;                   ///< how many calls in a row
    long result = -1;                ///< what the call returns
    int error = 5;                   ///< errno (EIO), or the platform's error code
    std::function<void()> action{};  ///< if set: done first, and then the call takes place as ever
    int seen = 0;                    ///< matching calls so far
};

/// A change of one file, as the kernel was asked for it.
struct FileChange {
    enum class Kind { kWrite, kLength, kFlush } kind;
    size_t at = 0;  ///< where the data goes, or the new length
    std::string data = {};
};

class Script {
public:
    static Script &Current();

    void Reset() { *this = Script(); }

    void Fail(Fault fault) { faults_.push_back(std::move(fault)); }
    /// Ends all faults; those that never matched a call are returned by name.
    std::vector<std::string> Finish();

    /// Counts a call, and says how it is to fail.
    std::optional<Fault> Take(std::string_view call, std::string_view about = {});
    [[nodiscard]] int Calls(std::string_view call, std::string_view about = {}) const;
    /// All calls in order, each by its name and what it was about.
    [[nodiscard]] std::vector<std::pair<std::string, std::string>> Calls() const { return calls_; }

    /// Before the effect stand the locks that are held: "[folder status] ".
    void Record(const std::string &effect);
    [[nodiscard]] std::vector<std::string> Journal() const { return journal_; }
    void ClearJournal() { calls_.clear(), journal_.clear(); }

    std::set<std::string> locks;

    /// The changes of the file at this path, while it is set.
    std::string watched;
    std::vector<FileChange> changes;

    /// Fixed answers of time() and rand(), while set; how much more time has passed than really has.
    std::optional<long> now;
    std::optional<int> random;
    long secondsPassed = 0;

private:
    std::vector<Fault> faults_;
    std::vector<std::pair<std::string, std::string>> calls_;
    std::vector<std::string> journal_;
};

}  // namespace fileindex_test
