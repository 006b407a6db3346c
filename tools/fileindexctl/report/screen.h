/// \file
/// A terminal on which something is shown again and again in the same place.
#pragma once

#include <csignal>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

/// For the length of its scope the cursor is hidden and long lines are cut by the terminal.
class Screen {
public:
    /// Does stdout lead to a terminal that can do this, and colours?
    static bool IsUsable();

    Screen() { Enter(); }
    ~Screen() { Leave(); }
    Screen(const Screen &) = delete;
    Screen &operator=(const Screen &) = delete;

    static unsigned Width();

    /// Shows the lines, made printable, in place of the former ones; as many as fit.
    void Draw(const std::vector<std::string> &lines);

    /// Hands the terminal back for a while.
    void Leave();
    void Enter();

private:
    std::size_t drawn_ = 0;
};

/// The signals by which people and the system end, stop or resize a program, taken one by one instead of being
/// acted on: what they interrupt can then be put in order.
class Signals {
public:
    Signals();
    ~Signals();
    Signals(const Signals &) = delete;
    Signals &operator=(const Signals &) = delete;

    /// The signal that came, or 0 when none did in that time.
    int Await(unsigned long seconds) const;

    /// Lets the signal have its usual effect.
    void Deliver(int signal) const;

private:
    sigset_t taken_{};
    sigset_t before_{};
};

}  // namespace VORK::FILEINDEXCTL
