#include "report/screen.h"

#include "report/text.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <string_view>

namespace VORK::FILEINDEXCTL {

namespace {

constexpr const char *kEnter = "\033[?25l\033[?7l";  // no cursor, no wrapping
constexpr const char *kLeave = "\033[?7h\033[?25h";
constexpr const char *kEndLine = "\033[K\n";  // and clear what is left of it
constexpr const char *kClearBelow = "\033[J";

winsize Size() {
    winsize size{};
    ioctl(STDOUT_FILENO, TIOCGWINSZ, &size);  // leaves zeros where nobody knows
    size.ws_col = size.ws_col > 0 ? size.ws_col : 80;
    size.ws_row = size.ws_row > 0 ? size.ws_row : 24;
    return size;
}

}  // namespace

bool Screen::IsUsable() {
    const char *terminal = std::getenv("TERM");
    return isatty(STDOUT_FILENO) != 0 && terminal != nullptr && std::string_view(terminal) != "dumb";
}

unsigned Screen::Width() {
    return Size().ws_col;
}

void Screen::Enter() {
    drawn_ = 0;
    std::fputs(kEnter, stdout);
}

void Screen::Leave() {
    std::fputs(kLeave, stdout);
    std::fflush(stdout);
}

void Screen::Draw(const std::vector<std::string> &lines) {
    if (drawn_ > 0) {
        std::printf("\033[%zuA\r", drawn_);
    }
    const std::size_t room = Size().ws_row - 1U;  // the cursor stands below
    drawn_ = std::min(lines.size(), room);
    for (std::size_t i = 0; i < drawn_; ++i) {
        std::fputs((Printable(lines[i]) + kEndLine).c_str(), stdout);
    }
    std::fputs(kClearBelow, stdout);
    std::fflush(stdout);
}

Signals::Signals() {
    sigemptyset(&taken_);
    for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGTSTP, SIGWINCH}) {
        struct sigaction action {};
        // What the parent had ignored, as nohup does, stays so.
        if (sigaction(signal, nullptr, &action) == 0 && action.sa_handler != SIG_IGN) {
            sigaddset(&taken_, signal);
        }
    }
    sigprocmask(SIG_BLOCK, &taken_, &before_);
}

Signals::~Signals() {
    sigprocmask(SIG_SETMASK, &before_, nullptr);
}

int Signals::Await(unsigned long seconds) const {
    const timespec time{static_cast<time_t>(seconds), 0};
    return std::max(sigtimedwait(&taken_, nullptr, &time), 0);
}

void Signals::Deliver(int signal) const {
    raise(signal);
    sigset_t only{};
    sigemptyset(&only);
    sigaddset(&only, signal);
    sigprocmask(SIG_UNBLOCK, &only, nullptr);
    sigprocmask(SIG_BLOCK, &only, nullptr);
}

}  // namespace VORK::FILEINDEXCTL
