#include "base/json/elements.h"
#include "base/json/text.h"
#include "folders/folder_access.h"
#include "folders/media_kinds.h"
#include "names.h"
#include "progress/progress.h"
#include "records.h"

#include <fileindex/error.h>
#include <fileindex/folder.h>
#include <fileindex/indexability.h>
#include <fileindex/json_access.h>
#include <fileindex/paths.h>

#include <syslog.h>

namespace VORK {
namespace FILEINDEX {

using internal::kFolderModule;
using internal::kNameKey;
using internal::kPathKey;

bool Folder::Load(const std::string &sharePath, const Json::Value &record) {
    path = sharePath;
    RetrieveStringFromJsonObj(name, kNameKey, record);
    for (const auto &[key, flag] : internal::kMediaKinds) {
        RetrieveBoolFromJsonObj(this->*flag, key, record);
    }
    return internal::FolderAccess::Resolve(*this);
}

bool Folder::Reload(const std::string &sharePath, const Json::Value &record) {
    // The argument may be our own field, which is reset below.
    const std::string newPath = sharePath;  // NOLINT(performance-unnecessary-copy-initialization)
    name.clear();
    path.clear();
    document = audio = video = photo = false;
    return Load(newPath, record);
}

bool Folder::SetPath(const std::string &sharePath) {
    path = sharePath;
    return internal::FolderAccess::Resolve(*this);
}

std::string Folder::GetFullPath() const {
    if (!full_path_.empty()) {
        return full_path_;
    }
    std::string fullPath;
    if (!FILEINDEX::GetFullPath(fullPath, path)) {
        syslog(LOG_ERR, "%s:%d Failed to get full path from %s", kFolderModule, __LINE__, path.c_str());
    }
    return fullPath;
}

Json::Value Folder::asJson() const {
    Json::Value record(Json::objectValue);
    record[kPathKey] = path;
    record[kNameKey] = name;
    for (const auto &[key, flag] : internal::kMediaKinds) {
        record[key] = this->*flag;
    }
    return record;
}

Json::Value Folder::asJson(const Json::Value &additional) const {
    Json::Value record = asJson();
    if (!GetAdditional(record["additional"], additional)) {
        syslog(LOG_ERR, "%s:%d GetAdditional failed", kFolderModule, __LINE__);
    }
    return record;
}

bool Folder::AddToJson(Json::Value &obj) const {
    if (!obj.isObject()) {
        return false;
    }
    obj[path] = asJson();
    return true;
}

bool Folder::GetAdditional(Json::Value &out, const std::string &key) const {
    if (key == "status") {
        out = internal::FolderProgress(path);
        return true;
    }
    if (key == "is_valid") {
        out = CanPathBeIndexed(path);
        return true;
    }
    syslog(LOG_ERR, "%s:%d Unknown additional: %s", kFolderModule, __LINE__, key.c_str());
    ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
    return false;
}

bool Folder::GetAdditional(Json::Value &out, const Json::Value &keys) const {
    out = Json::Value(Json::objectValue);
    if (!keys.isArray()) {
        syslog(LOG_ERR, "%s:%d Bad param: %s", kFolderModule, __LINE__, ToString(keys).c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
        return false;
    }
    for (const Json::Value &key : Elements(keys)) {
        if (!key.isString()) {
            syslog(LOG_ERR, "%s:%d Bad param: %s", kFolderModule, __LINE__, ToString(key).c_str());
            ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);
            return false;
        }
        // Naming the member makes it: an unknown key stays in the answer as null, and callers look for it there.
        const std::string fact = key.asString();
        if (!GetAdditional(out[fact], fact)) {
            syslog(LOG_ERR, "%s:%d Failed to get additional: %s", kFolderModule, __LINE__, fact.c_str());
        }
    }
    return true;
}

}  // namespace FILEINDEX
}  // namespace VORK
