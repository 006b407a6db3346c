/// \file
/// How fast what waits in queues gets less, reckoned from looks at them. Asks nobody, not even the clock.
#pragma once

#include <deque>
#include <map>
#include <optional>
#include <string>

namespace VORK::FILEINDEXCTL {

/// The daemon takes a queue as a whole and removes it when it is through, while others add to the next one. So the
/// sum of what waits tells little: what counts as done is what stood in files that are gone, or have shrunk.
class Progress {
public:
    /// Events by the identity of the file that holds them, at a time in seconds. Looks come in order.
    void Add(double time, const std::map<std::string, unsigned long> &files);

    unsigned long Left() const;
    unsigned long Done() const { return looks_.empty() ? 0 : looks_.back().done; }

    /// Events per second over the last ten minutes or so; nothing before something was done in them.
    std::optional<double> Rate() const;

    /// Until all that waits now is done, at that rate.
    std::optional<double> SecondsLeft() const;

    /// Since something was last done or, before that, since the first look, while something waits.
    double SecondsWithoutProgress() const;

    /// "120/min no longer waiting, about 5 min left", "no progress for 12 min", "measuring", "nothing waits".
    std::string Text() const;

private:
    struct Look {
        double time;
        unsigned long done;
    };

    std::map<std::string, unsigned long> files_;
    std::deque<Look> looks_;  // those of the last ten minutes, and the one before
    double lastProgress_ = 0;
};

/// "59 s", "12 min", "5 h", "3 days".
std::string DurationText(double seconds);

}  // namespace VORK::FILEINDEXCTL
