#include "facts/whole_file.h"

#include "base/unique_fd.h"
#include "base/whole_file.h"
#include "report/failure.h"

#include <sys/stat.h>

#include <cerrno>

namespace VORK::FILEINDEXCTL {

namespace {

mode_t DefaultMode() {
    const mode_t mask = umask(0);
    umask(mask);
    return static_cast<mode_t>(0666) & ~mask;
}

}  // namespace

std::string ReadWhole(const std::string &path) {
    const UniqueFd file(path == "-" ? dup(STDIN_FILENO) : open(path.c_str(), O_RDONLY | O_CLOEXEC));
    if (!file) {
        throw ErrnoFailure(path, "opened", ExitStatus::kNoSuchFolder);
    }
    auto text = ReadAll(file.Get());
    if (!text && errno == EFBIG) {
        throw Failure(ExitStatus::kMalformed, path + " is too large for a configuration");
    }
    if (!text) {
        throw ErrnoFailure(path, "read", ExitStatus::kNoSuchFolder);
    }
    return std::move(*text);
}

void WriteWhole(const std::string &path, const std::string &text) {
    struct stat status {};
    if (stat(path.c_str(), &status) == 0 && !S_ISREG(status.st_mode)) {
        throw Failure(ExitStatus::kUsage, path + " is no ordinary file, and would be replaced by one");
    }
    if (!ReplaceFile(path, text, DefaultMode(), Replacing::kDocument)) {
        throw ErrnoFailure(path, "written");
    }
}

}  // namespace VORK::FILEINDEXCTL
