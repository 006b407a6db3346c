/// \file
/// What stops a command before it changed anything: an exit status and a sentence for the user.
#pragma once

#include "report/exit_status.h"
#include "report/text.h"

#include <fileindex/config.h>

#include <stdexcept>
#include <string>

namespace VORK::FILEINDEXCTL {

class Failure : public std::runtime_error {
public:
    // Escaped here, because what() would end at a NUL that a name brought along.
    Failure(ExitStatus status, const std::string &message)
        : std::runtime_error(Printable(message)), status_(status) {}

    ExitStatus Status() const { return status_; }

private:
    ExitStatus status_;
};

/// Forgets earlier error codes and log records. Success resets none of them, so this comes before each call whose
/// failure is to be explained.
void ForgetErrors();

/// Is it for lack of permission that the file cannot be written, or made in its directory?
bool MayNotWrite(const std::string &path);

/// Throws Failure unless this user may write both files of the configuration. Comes before all that may take one
/// of their locks, as events that cannot be queued do: a lock file that an ordinary user made would keep root out.
void RequireMayChange();

/// What to say when a file may not be read or written.
Failure Denied(const std::string &path);

/// "PATH cannot be WHAT", for the reason in errno; with that status unless it is for lack of permission.
Failure ErrnoFailure(const std::string &path, const char *what, ExitStatus status = ExitStatus::kCannotSave);

/// The library's last error code in words and as an exit status, for an operation on the file of `config`.
Failure FailureOf(const VORK::FILEINDEX::Config &config);

}  // namespace VORK::FILEINDEXCTL
