#include "names.h"
#include "records.h"
#include "share/location.h"
#include "share/lookup.h"
#include "share/volume.h"

#include <fileindex/error.h>
#include <fileindex/paths.h>

#include <sys/stat.h>
#include <syslog.h>

#include <string_view>
#include <utility>

namespace VORK {
namespace FILEINDEX {

namespace records = internal::records;

namespace {

std::string_view ShareOf(std::string_view sharePath) {
    return sharePath.substr(1, sharePath.find('/', 1) - 1);
}

}  // namespace

bool internal::GetVolume(std::string &volume, std::string_view sharePath) {
    if (sharePath.empty()) {
        syslog(LOG_ERR, "%s:%d GetShareNameByPath failed, path=%s", records::kEmptyPath.module,
               records::kEmptyPath.line, "");
        return false;
    }
    // The platform would see the path up to a NUL only, and so another one.
    const internal::Share share =
        HasNul(sharePath) ? internal::Share() : internal::FindShare(std::string(ShareOf(sharePath)));
    if (!share) {
        ErrorHandler::SetError(FILEINDEX_ERR_PATH);
        return false;
    }
    const std::string_view directory = share->szPath;
    volume = directory.substr(0, directory.rfind('/'));  // all of it when there is no "/"
    return true;
}

bool GetFullPath(std::string &out, const std::string &sharePath) {
    std::string fullPath;
    if (!internal::GetVolume(fullPath, sharePath)) {
        return false;
    }
    fullPath += sharePath;
    out = std::move(fullPath);
    return true;
}

bool GetShareNameByPath(std::string &outShareName, const std::string &sharePath) {
    if (sharePath.empty()) {
        return false;
    }
    outShareName = std::string(ShareOf(sharePath));  // may be the argument itself
    return true;
}

bool GetShareNamePathByFullPath(std::string &outShareName, std::string &outSharePath,
                                const std::string &fullPath) {
    char name[internal::kShareNameSize] = {};
    char path[internal::kPathSize] = {};
    if (HasNul(fullPath) || VORKShareNamePathGet(fullPath.c_str(), name, sizeof(name), path, sizeof(path)) < 0) {
        syslog(LOG_ERR, "%s:%d VORKShareNamePathGet failed, path=%s", records::kOutsideShares.module,
               records::kOutsideShares.line, fullPath.c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_PATH);
        return false;
    }
    outShareName = name;
    outSharePath = path;
    return true;
}

std::string ReplaceShareName(const std::string &sharePath, const std::string &newShareName) {
    if (sharePath.empty()) {
        return std::string();
    }
    const std::size_t rest = sharePath.find('/', 1);
    const std::string root = "/" + newShareName;
    return rest == std::string::npos ? root : root + sharePath.substr(rest);
}

bool StringStartWith(const std::string &str, const std::string &prefix) {
    return str.compare(0, prefix.size(), prefix) == 0;
}

bool IsDirExist(const std::string &path) {
    struct stat status = {};
    return !HasNul(path) && lstat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

bool IsFileExist(const std::string &path) {
    struct stat status = {};
    return !HasNul(path) && lstat(path.c_str(), &status) == 0 && S_ISREG(status.st_mode);
}

}  // namespace FILEINDEX
}  // namespace VORK
