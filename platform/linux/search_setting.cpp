// The search setting: the member "search" of the platform's file.
#include "base/json/document.h"
#include "base/platform_files.h"
#include "base/whole_file.h"
#include "common/failure.h"
#include "common/file_lock.h"

#include <vork/error.h>
#include <vork/search.h>

#include <cerrno>
#include <exception>
#include <optional>
#include <string>

using namespace VORK;
using namespace VORK::PLATFORM;

namespace {

constexpr const char *kMember = "search";
constexpr mode_t kModeOfNewFile = 0644;

// The whole document, empty when the file was never written. Nothing, with the platform error set, on failure.
std::optional<Json::Value> ReadDocument() {
    const std::optional<std::string> text = ReadFile(kPlatformFile);
    if (!text && errno == ENOENT) {
        return Json::Value(Json::objectValue);
    }
    if (!text) {
        FailErrno(errno);
        return std::nullopt;
    }
    std::optional<Json::Value> document = ParseObject(*text);
    if (!document) {
        Fail(VORK_ERR_MALFORMED);
    }
    return document;
}

bool IsOn(const Json::Value &document) {
    const Json::Value &setting = document[kMember];
    return setting.isBool() && setting.asBool();
}

}  // namespace

int VORKSMBIsEnableSpotlight(void) try {
    const std::optional<Json::Value> document = ReadDocument();
    return document && IsOn(*document) ? 1 : 0;
} catch (const std::exception &) {
    Fail(VORK_ERR_IO);
    return 0;
}

int VORKSMBSetSpotlight(int enable) try {
    const std::optional<FileLock> lock = TakeLock(std::string(kPlatformFile) + ".lock");
    if (!lock) {
        return FailErrno(errno);
    }
    std::optional<Json::Value> document = ReadDocument();
    if (!document) {
        return -1;
    }
    const bool wanted = enable != 0;
    if (document->isMember(kMember) && IsOn(*document) == wanted && (*document)[kMember].isBool()) {
        return 0;
    }
    (*document)[kMember] = wanted;
    const std::string text = FormatDocument(*document);
    return ReplaceFile(kPlatformFile, text, kModeOfNewFile, Replacing::kSettings) ? 0 : FailErrno(errno);
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}
