#include "process/remove.h"

#include "common/failure.h"
#include "filesystem/open_directory.h"
#include "process/run_program.h"
#include "shares/share_source.h"

#include <vork/error.h>

#include <sys/stat.h>

#include <cerrno>
#include <memory>
#include <string>

namespace VORK::PLATFORM {

namespace {

constexpr const char *kProgram = "/bin/rm";
constexpr int kNotRemoved = 1;

int Refuse(int code, Place where = Place::Here()) {
    Fail(code, where);
    return kNotRemoved;
}

int RunIn(int directory, const char *options, const char *name) {
    // A name may begin with "-".
    const char *const argv[] = {kProgram, options, "--", name, nullptr};
    return ResultOf(RunProgram(kProgram, argv, {.directory = directory}));
}

}  // namespace

int RemoveInShare(const char *options, const char *path) {
    if (options == nullptr || options[0] != '-' || path == nullptr || path[0] != '/') {
        return Refuse(VORK_ERR_BAD_PARAMETER);
    }
    const DirectoryAndName place(path);
    if (!IsComponent(place.name)) {
        return Refuse(VORK_ERR_BAD_PARAMETER);
    }
    const std::shared_ptr<const ShareTable> shares = Shares().Current().table;
    if (shares->Holding(place.directory) == nullptr) {
        return Refuse(VORK_ERR_NO_SUCH_SHARE);
    }
    const UniqueFd directory = OpenDirectory(*shares, place.directory);
    struct stat status {};
    if (!directory || fstat(directory.Get(), &status) != 0) {
        return Refuse(CodeOfErrno(errno));
    }
    return status.st_uid == 0 ? RunIn(directory.Get(), options, place.name.c_str()) : Refuse(VORK_ERR_ACCESS);
}

}  // namespace VORK::PLATFORM
