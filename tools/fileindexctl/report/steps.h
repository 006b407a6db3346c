/// \file
/// The step-by-step report of a change.
///
/// The library saves first and tells the other parties afterwards, and rolls nothing back. So a failed change is
/// one of two things, and the exit status says which: what failed after something was changed is "partly done"
/// (70), with every step listed; when the first step to fail is also the first of all, nothing has been changed,
/// and the status is that of the cause: a file (65, 73, 75, 77), or the daemon or a service (69).
#pragma once

#include "facts/patience.h"
#include "facts/records.h"
#include "report/exit_status.h"
#include "report/output.h"

#include <fileindex/config.h>

#include <functional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEXCTL {

enum class StepResult {
    kDone,
    kAlready,  ///< was so before
    kFailed,   ///< the change stopped here
    kWentOn,   ///< failed, which the library does not count
    kNotReached,
    kSkipped,
};

/// What a step's failure leaves behind.
enum class Evidence {
    kRecord,     ///< one of the step's fatal records
    kErrorCode,  ///< none of them, but an error code: the step saves the configuration
    kNone,       ///< nothing
};

/// A step as the library will take it, with the records that tell of its failure.
struct PlannedStep {
    std::string name;
    std::string trouble;            ///< what a failure means, in words
    std::vector<Mark> fatal;        ///< records after which the library stops
    std::vector<Mark> tolerated{};  ///< records after which it goes on
    Evidence evidence = Evidence::kRecord;
    std::set<std::string> shares{};  ///< those whose queues it writes to
};

/// The step that locks, reads, changes and saves the file of a configuration.
PlannedStep SaveStep(const std::string &name = "saved");

class StepReport {
public:
    /// What became of the planned steps in a call that answered `succeeded`. The step that failed is the first
    /// with a fatal record; if none has one, the one that leaves none.
    static StepReport Trace(const std::vector<PlannedStep> &plan, bool succeeded);

    /// Makes the call and traces it. Throws Failure when nothing was done because of the file of `config`.
    static StepReport Perform(const std::vector<PlannedStep> &plan, const VORK::FILEINDEX::Config &config,
                              const std::function<bool()> &call);

    /// The same for a plan that begins with a SaveStep. The call is made again, for as long as `patience` lasts,
    /// while it ends because another program holds that step's lock: nothing has been done then. Needs the right
    /// to change the configuration.
    static StepReport Perform(const std::vector<PlannedStep> &plan, const VORK::FILEINDEX::Config &config,
                              Patience &patience, const std::function<bool()> &call);

    /// `record` is the library's record of a failure, for programs.
    void Add(const std::string &name, StepResult result, const std::string &detail = std::string(),
             const std::string &record = std::string());

    /// A step that the tool takes itself.
    void Add(const std::string &name, bool done, const std::string &trouble);

    /// Changes the result of a step that Trace saw done; another stays.
    void Correct(const std::string &name, StepResult result, const std::string &detail = std::string());

    /// Steps that failed or were not reached are put down as skipped, with this reason.
    void Excuse(const std::string &reason);

    void Append(const StepReport &more);

    bool Has(StepResult result) const;

    /// Done, Partly or Unreachable.
    ExitStatus Status() const;

    /// Lines for people, "steps" for programs, a warning for each failure that the library does not count.
    void Show(Output &output) const;

    /// The same on stderr, when stdout is another program's.
    void Note(Output &output) const;

private:
    struct Step {
        std::string name;
        StepResult result;
        std::string detail;
        std::string record;
    };

    std::vector<std::string> Tell(Output &output) const;

    std::vector<Step> steps_;
};

/// Turns "events queued" into a failure when the library dropped an event: a queue that stays locked, or takes
/// only part of a line, counts as success there and leaves only a record.
void MarkDroppedEvents(StepReport &report);

}  // namespace VORK::FILEINDEXCTL
