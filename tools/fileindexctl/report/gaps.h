/// \file
/// What a report could not find out, and why.
#pragma once

#include "report/exit_status.h"
#include "report/failure.h"
#include "report/output.h"

#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

class Gaps {
public:
    /// Something that cannot be told, which is no failure.
    void Add(const std::string &warning) { warnings_.push_back(warning); }

    /// A queue that may not be read. The other shares are reported all the same.
    void AddQueue(const std::string &share, const Failure &failure);

    const std::vector<std::string> &Warnings() const { return warnings_; }

    /// Warns of all of them; the status to end with.
    ExitStatus Report(Output &output) const;

private:
    std::vector<std::string> warnings_{};
    ExitStatus status_ = ExitStatus::kDone;
};

}  // namespace VORK::FILEINDEXCTL
