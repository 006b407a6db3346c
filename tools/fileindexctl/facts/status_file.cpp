#include "facts/status_file.h"

#include "report/failure.h"

namespace VORK::FILEINDEXCTL {

namespace {

std::set<std::string> NamesIn(const Json::Value &object) {
    const auto names = object.isObject() ? object.getMemberNames() : Json::Value::Members();
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
    return document_.isObject() ? NamesIn(document_[flag]) : std::set<std::string>();
}

std::set<std::string> StatusFile::Markers() {
    std::set<std::string> markers = NamesIn(document_);
    std::erase_if(markers, [this](const std::string &name) {
        return name == "resume_time" || name == "no_space" || name == "need_reindex" || !IsUpdated(name);
    });
    return markers;
}

}  // namespace VORK::FILEINDEXCTL
