#include "report/gaps.h"

#include "report/text.h"

namespace VORK::FILEINDEXCTL {

void Gaps::AddQueue(const std::string &share, const Failure &failure) {
    warnings_.push_back("the queue of the share " + Quoted(share) + " is left out: " + failure.what());
    status_ = failure.Status();
}

ExitStatus Gaps::Report(Output &output) const {
    for (const auto &warning : warnings_) {
        output.Warn(warning);
    }
    if (status_ != ExitStatus::kDone) {
        output.Error(status_, "not every queue could be read");
    }
    return status_;
}

}  // namespace VORK::FILEINDEXCTL
