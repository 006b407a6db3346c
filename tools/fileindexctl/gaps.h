/// \file
/// What a report has to do without.
#ifndef FILEINDEXCTL_GAPS_H
#define FILEINDEXCTL_GAPS_H

#include "exit_status.h"
#include "failure.h"
#include "output.h"

#include <string>
#include <vector>

namespace fileindexctl {

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
    ExitStatus status_ = ExitStatus::Done;
};

}  // namespace fileindexctl

#endif
