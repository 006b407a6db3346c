#include "common/failure.h"

#include <vork/error.h>

#include <cerrno>
#include <cstring>

namespace VORK::PLATFORM {

namespace {

// The directories of the build machine tell nobody anything.
const char *FileNameOf(const char *path) {
    const char *slash = std::strrchr(path, '/');
    return slash == nullptr ? path : slash + 1;
}

}  // namespace

int Fail(int code, Place where) {
    VLIBCErrSetEx(code, FileNameOf(where.file), where.line);
    return -1;
}

int FailErrno(int error, Place where) {
    return Fail(CodeOfErrno(error), where);
}

int CodeOfErrno(int error) {
    switch (error) {
        case ENOENT:
        case ENOTDIR:
            return VORK_ERR_NOT_FOUND;
        case EEXIST:
            return VORK_ERR_EXISTS;
        case EACCES:
        case EPERM:
        case EROFS:
        case ELOOP:
            return VORK_ERR_ACCESS;
        case ENOSPC:
            return VORK_ERR_NO_SPACE;
        case EDQUOT:
            return VORK_ERR_QUOTA;
        case ETIMEDOUT:
            return VORK_ERR_TIMEOUT;
        case EINVAL:
        case ENAMETOOLONG:
            return VORK_ERR_BAD_PARAMETER;
        default:
            return VORK_ERR_IO;
    }
}

}  // namespace VORK::PLATFORM
