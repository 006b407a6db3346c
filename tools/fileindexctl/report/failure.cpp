#include "report/failure.h"

#include "facts/records.h"
#include "facts/status_file.h"

#include <fileindex/error.h>
#include <fileindex/folders.h>
#include <fileindex/status.h>

#include <vork/error.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::Config;
using VORK::FILEINDEX::ErrorHandler;

bool IsDenied(int error) {
    return error == EACCES || error == EPERM || error == EROFS;
}

bool MayNot(const std::string &path, int mode) {
    return faccessat(AT_FDCWD, path.c_str(), mode, AT_EACCESS) != 0 && IsDenied(errno);
}

// All causes have one code. The file is only looked at: one that is made here might be a stranger's for root.
Failure LockFailure(const std::string &path) {
    struct stat status {};
    const bool isThere = lstat(path.c_str(), &status) == 0;
    if (isThere && !S_ISREG(status.st_mode)) {
        return {ExitStatus::kCannotSave, path + " is no regular file, so it does not count as a lock; remove it"};
    }
    if (isThere && status.st_uid != 0 && status.st_uid != geteuid()) {
        return {ExitStatus::kPermission, path + " belongs to user " + std::to_string(status.st_uid) +
                                             ", so it does not count as a lock; \"fileindexctl doctor --fix\" "
                                             "replaces it if it is empty"};
    }
    if (MayNotWrite(path)) {
        return Denied(path);
    }
    return {ExitStatus::kBusy, path + " is locked by another program; try again"};
}

Failure LoadFailure(const std::string &path) {
    if (MayNot(path, R_OK)) {
        return Denied(path);
    }
    return {ExitStatus::kMalformed, path + " cannot be read as JSON"};
}

Failure SaveFailure(const std::string &path) {
    if (MayNotWrite(path)) {
        return Denied(path);
    }
    const std::string directory = path.substr(0, path.rfind('/'));
    if (access(directory.c_str(), F_OK) != 0) {
        return {ExitStatus::kCannotSave, path + " cannot be saved: there is no directory " + directory};
    }
    struct statvfs status {};
    const bool isFull = statvfs(directory.c_str(), &status) == 0 && status.f_bavail == 0;
    return {ExitStatus::kCannotSave, path + " cannot be saved" +
                                         (isFull ? ": no room is left on its file system" : "") +
                                         (access(path.c_str(), F_OK) == 0 ? "; the old content stands" : "")};
}

}  // namespace

Failure Denied(const std::string &path) {
    struct statvfs status {};
    const std::string directory = path.substr(0, path.rfind('/') + 1);
    if (statvfs(directory.c_str(), &status) == 0 && (status.f_flag & ST_RDONLY) != 0 && !MayNot(path, R_OK)) {
        return {ExitStatus::kPermission, path + " cannot be written: " + std::strerror(EROFS)};
    }
    return {ExitStatus::kPermission, "no permission for " + path + "; run this as the administrator"};
}

Failure ErrnoFailure(const std::string &path, const char *what, ExitStatus status) {
    const int error = errno;
    return {IsDenied(error) ? ExitStatus::kPermission : status,
            path + " cannot be " + what + ": " + std::strerror(error)};
}

void RequireMayChange() {
    if (geteuid() == 0) {
        return;  // what root makes counts for everybody
    }
    for (const std::string &path : {VORK::FILEINDEX::Folders().GetPath(), VORK::FILEINDEX::Status().GetPath()}) {
        const std::string directory = path.substr(0, path.rfind('/'));
        if (MayNotWrite(path) || access(directory.c_str(), F_OK) != 0) {
            throw Denied(path);
        }
    }
}

bool MayNotWrite(const std::string &path) {
    return MayNot(path, W_OK) ||
           (access(path.c_str(), F_OK) != 0 && MayNot(path.substr(0, path.rfind('/')), W_OK));
}

void ForgetErrors() {
    ErrorHandler::SetError(VORK::FILEINDEX::FILEINDEX_ERR_NONE);
    VLIBCErrSetEx(0, "", 0);
    Records().Clear();
}

Failure FailureOf(const Config &config) {
    using namespace VORK::FILEINDEX;
    switch (ErrorHandler::GetError()) {
        case FILEINDEX_ERR_LOCK:
            return LockFailure(config.GetLockPath());
        case FILEINDEX_ERR_LOAD_JSON:
            return LoadFailure(config.GetPath());
        case FILEINDEX_ERR_MALFORMED_CONFIG:
            return {ExitStatus::kMalformed, config.GetPath() + " is not a JSON object"};
        case FILEINDEX_ERR_SAVE_JSON:
            return SaveFailure(config.GetPath());
        case FILEINDEX_ERR_EXCEED_MAX_FOLDER:
            return {ExitStatus::kCannotSave, "there are 1000 folders already; no more can be added"};
        case FILEINDEX_ERR_NO_SUCH_FOLDER:
            return {ExitStatus::kNoSuchFolder, "no such folder"};
        case FILEINDEX_ERR_PATH:
            return {ExitStatus::kNoSuchFolder, "the path lies in no share that is present"};
        case FILEINDEX_ERR_BAD_PARAM:
            return {ExitStatus::kUsage, "the library refused the request: " + Records().Last()};
        default:
            if (StatusFile file;
                file.GetPath() == config.GetPath() && file.Load() && !file.Document().isObject()) {
                return {ExitStatus::kMalformed, config.GetPath() + " is not a JSON object"};
            }
            return {ExitStatus::kPartly, "the library failed without a reason: " + Records().Last()};
    }
}

}  // namespace VORK::FILEINDEXCTL
