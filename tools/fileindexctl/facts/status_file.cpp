#include "facts/status_file.h"

#include "base/json/elements.h"
#include "report/failure.h"
#include "src/names.h"

namespace VORK::FILEINDEXCTL {

using VORK::FILEINDEX::internal::kNeedReindexKey;
using VORK::FILEINDEX::internal::kNoSpaceKey;
using VORK::FILEINDEX::internal::kResumeTimeKey;

namespace {

std::set<std::string> NameSet(const Json::Value &object) {
    const auto names = MemberNames(object);
    return {names.begin(), names.end()};
}

}  // namespace

long long StatusFile::LoadPause() {
    long long resumeTime = -1;
    ForgetErrors();
    if (!Load()) {
        throw FailureOf(*this);
    }
    if (!GetPauseInfo(resumeTime)) {
        throw Failure(ExitStatus::kMalformed, GetPath() + ": \"resume_time\" is no number");
    }
    return resumeTime;
}

std::set<std::string> StatusFile::Marked(const char *flag) const {
    return document_.isObject() ? NameSet(document_[flag]) : std::set<std::string>();
}

std::set<std::string> StatusFile::Markers() {
    std::set<std::string> markers = NameSet(document_);
    std::erase_if(markers, [this](const std::string &name) {
        return name == kResumeTimeKey || name == kNoSpaceKey || name == kNeedReindexKey || !IsUpdated(name);
    });
    return markers;
}

}  // namespace VORK::FILEINDEXCTL
