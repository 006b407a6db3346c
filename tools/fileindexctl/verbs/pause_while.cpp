// "pause --run": indexing stands still while a command runs.
#include "report/schedule.h"
#include "verbs/verb.h"

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstring>

namespace VORK::FILEINDEXCTL {

namespace {

// Other programs hold a lock for moments, and a pause that is left behind is worse than a wait.
constexpr std::chrono::seconds kLeastPatience(10);

constexpr int kCannotRun = 126;
constexpr int kNotFound = 127;
constexpr int kSignalled = 128;

// What ends programs is kept for the command, so that the pause is always taken back.
class HeldSignals {
public:
    HeldSignals() {
        signal(SIGCHLD, SIG_DFL);  // a parent may have left it ignored, and then there would be no exit status
        sigemptyset(&held_);
        for (const int number : {SIGINT, SIGQUIT, SIGTERM, SIGHUP, SIGCHLD}) {
            sigaddset(&held_, number);
        }
        sigprocmask(SIG_BLOCK, &held_, &before_);
    }
    ~HeldSignals() { sigprocmask(SIG_SETMASK, &before_, nullptr); }
    HeldSignals(const HeldSignals &) = delete;
    HeldSignals &operator=(const HeldSignals &) = delete;

    const sigset_t &Before() const { return before_; }

    /// Hands on what comes until the process has ended; its wait status.
    int Await(pid_t process) const {
        int status = 0;
        while (waitpid(process, &status, WNOHANG) == 0) {
            siginfo_t info{};
            const int number = sigwaitinfo(&held_, &info);
            // A key on the terminal has reached the command as well.
            if (number > 0 && number != SIGCHLD && info.si_code != SI_KERNEL) {
                kill(process, number);
            }
        }
        return status;
    }

private:
    sigset_t held_{};
    sigset_t before_{};
};

// An exit status as a shell gives it.
int Run(const std::vector<std::string> &command, const HeldSignals &signals, Output &output) {
    std::vector<char *> arguments(command.size() + 1);  // the last one stays null
    std::transform(command.begin(), command.end(), arguments.begin(),
                   [](const std::string &word) { return const_cast<char *>(word.c_str()); });
    posix_spawnattr_t attributes;
    posix_spawn_file_actions_t actions;
    posix_spawnattr_init(&attributes);
    posix_spawnattr_setsigmask(&attributes, &signals.Before());
    posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGMASK);
    posix_spawn_file_actions_init(&actions);
    if (output.IsJson()) {  // stdout holds one document and nothing else
        posix_spawn_file_actions_adddup2(&actions, STDERR_FILENO, STDOUT_FILENO);
    }
    pid_t process = 0;
    const int error = posix_spawnp(&process, arguments.front(), &actions, &attributes, arguments.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    posix_spawnattr_destroy(&attributes);
    if (error != 0) {
        const int result = error == ENOENT ? kNotFound : kCannotRun;
        output.Error(static_cast<ExitStatus>(result), command.front() + " cannot be run: " + std::strerror(error));
        return result;
    }
    const int status = signals.Await(process);
    return WIFEXITED(status) ? WEXITSTATUS(status) : kSignalled + WTERMSIG(status);
}

// Nothing is to be done when somebody has changed the pause meanwhile, or it was without an end before.
ExitStatus Restore(long long before, Patience patience, Output &output) try {
    long long now = kNotPaused;
    if (!StatusMgr::GetPauseInfo(now) || now != kWithoutEnd || before == kWithoutEnd) {
        return ExitStatus::kDone;
    }
    const StepReport report = SetPause(IsPaused(before) ? before : kNotPaused, "end saved", patience);
    report.Note(output);
    return output.Conclude(report.Status(),
                           "the end of the pause is saved, but fileindexd does not know; once it runs: "
                           "\"fileindexctl resume\"");
} catch (const Failure &failure) {
    return output.Conclude(failure.Status(), std::string(failure.what()) +
                                                 "; indexing is still paused, \"fileindexctl resume\" goes on");
}

}  // namespace

ExitStatus PauseWhile(const std::vector<std::string> &command, Patience patience, Output &output) {
    long long resumeTime = kNotPaused;
    StatusMgr::GetPauseInfo(resumeTime);
    const HeldSignals signals;
    patience.HeedHeldSignals();  // they end the program if the wait is in vain
    SetPause(kWithoutEnd, "pause saved", patience).Note(output);
    const int result = Run(command, signals, output);
    const ExitStatus restored = Restore(resumeTime, Patience(std::max(patience.Time(), kLeastPatience)), output);
    output.Data()["exit_status"] = result;
    if (result != 0 && output.IsJson() && !output.Data().isMember("error")) {
        output.Error(static_cast<ExitStatus>(result),
                     "the command ended with exit status " + std::to_string(result));
    }
    if (StatusMgr::GetPauseInfo(resumeTime)) {
        output.Data()["resume_time"] = ToNumber(resumeTime);
        output.Note(PauseText(resumeTime));
    }
    return result != 0 ? static_cast<ExitStatus>(result) : restored;
}

}  // namespace VORK::FILEINDEXCTL
