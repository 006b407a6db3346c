#include "config/load_save.h"

#include "config/in_place_file.h"
#include "no_throw.h"
#include "records.h"

#include <fileindex/error.h>

#include <sys/stat.h>
#include <syslog.h>

#include <cerrno>

namespace VORK::FILEINDEX::internal {

namespace {

enum class Presence { kMissing, kPresent, kUnknown };

/// Only a path that certainly has no regular file counts as missing: a file that cannot be looked at is there
/// all the same, and treating it as missing would let the next save erase it.
Presence PresenceOf(const std::string &path) {
    struct stat status = {};
    if (lstat(path.c_str(), &status) == 0) {
        return S_ISREG(status.st_mode) ? Presence::kPresent : Presence::kMissing;
    }
    return errno == ENOENT || errno == ENOTDIR ? Presence::kMissing : Presence::kUnknown;
}

/// Reads again when the text is no JSON or a writer was at work: the writer may not have got the file's lock in
/// time, or may have it without getting to run. A file that is really broken is so the third time as well.
bool ReadAndParse(const std::string &path, const TextParser &parse) {
    constexpr int kAttempts = 3;
    for (int attempt = 1; attempt <= kAttempts; ++attempt) {
        std::string text;
        bool undisturbed = false;
        if (!ReadFile(path, text, undisturbed)) {
            return false;
        }
        if ((undisturbed || attempt == kAttempts) && parse(text)) {
            return true;
        }
    }
    return false;
}

}  // namespace

bool LoadConfig(const std::string &path, const TextParser &parse) {
    const Presence presence = PresenceOf(path);
    if (presence == Presence::kMissing) {
        return true;
    }
    // A file too large for memory is one more that cannot be read.
    if (presence == Presence::kPresent && NoThrow([&] { return ReadAndParse(path, parse); })) {
        return true;
    }
    syslog(LOG_ERR, "%s:%d Failed to load json from %s", kConfigModule, __LINE__, path.c_str());
    ErrorHandler::SetError(FILEINDEX_ERR_LOAD_JSON);
    return false;
}

bool SaveConfig(const std::string &path, const TextMaker &make) {
    const auto write = [&] {
        std::string text;
        return make(text) && WriteFile(path, text);
    };
    if (!NoThrow(write)) {
        syslog(LOG_ERR, "%s:%d Failed to save json to %s", kConfigModule, __LINE__, path.c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_SAVE_JSON);
        return false;
    }
    if (chmod(path.c_str(), 0644) == -1) {
        syslog(LOG_ERR, "%s:%d chmod failed, path=%s", kConfigModule, __LINE__, path.c_str());
    }
    return true;
}

}  // namespace VORK::FILEINDEX::internal
