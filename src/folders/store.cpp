#include "coverage.h"
#include "folder_access.h"
#include "json/text.h"
#include "names.h"

#include <fileindex/error.h>
#include <fileindex/folders.h>
#include <fileindex/json_access.h>
#include <fileindex/paths.h>

#include <syslog.h>

#include <cstddef>
#include <iterator>
#include <utility>

namespace VORK {
namespace FILEINDEX {

using internal::kFoldersModule;
using internal::ToString;

namespace {

using FolderMap = std::map<std::string, Folder>;

/// The folder that governs `fullPath` when the record stored under `path` is `own` (null: none is).
///
/// Walks the store as it was or will be without copying it.
const Folder *GoverningFolder(const FolderMap &folders, const std::string &fullPath, const std::string &path,
                              const Folder *own) {
    internal::Governing governing(fullPath);
    const auto split = folders.lower_bound(path);
    for (auto it = folders.begin(); it != split; ++it) {
        governing.Consider(it->second);
    }
    if (own != nullptr) {
        governing.Consider(*own);
    }
    for (auto it = folders.upper_bound(path); it != folders.end(); ++it) {
        governing.Consider(it->second);
    }
    return governing.Get();
}

/// True for each media kind that is indexed differently after the change. A side that no folder governs always
/// counts as a difference.
Json::Value ChangeReport(const Folder *before, const Folder *after) {
    Json::Value report(Json::objectValue);
    for (std::size_t kind = 0; kind < std::size(internal::kMediaKeys); ++kind) {
        const bool Folder::*flag = internal::kMediaFlags[kind];
        report[internal::kMediaKeys[kind]] =
            before == nullptr || after == nullptr || before->*flag != after->*flag;
    }
    return report;
}

}  // namespace

Folders::Folders() = default;

Folders::~Folders() = default;

std::string Folders::GetLockPath() const {
    return internal::kFolderLock;
}

std::string Folders::GetPath() const {
    return internal::kFolderConf;
}

bool Folders::Get(Json::Value &out, const std::string &path) {
    const auto found = folders_.find(path);
    if (found == folders_.end()) {
        syslog(LOG_ERR, "%s:%d No such folder: %s", kFoldersModule, __LINE__, path.c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_NO_SUCH_FOLDER);
        return false;
    }
    out = found->second.asJson();
    return true;
}

bool Folders::List(std::vector<Folder> &out) {
    return List(out, std::string());
}

bool Folders::List(std::vector<Folder> &out, const std::string &share) {
    const std::string wanted = share;  // may be a field of the list that is cleared now
    out.clear();
    for (const auto &[path, folder] : folders_) {
        std::string owner;
        if (wanted.empty() || (GetShareNameByPath(owner, folder.path) && owner == wanted)) {
            out.push_back(folder);
        }
    }
    return true;
}

bool Folders::Upsert(Json::Value &out, const Json::Value &folder) {
    std::string path;
    std::string fullPath;
    if (!RetrieveStringFromJsonObj(path, internal::kPathKey, folder) || !GetFullPath(fullPath, path)) {
        syslog(LOG_ERR, "%s:%d Bad param: %s", kFoldersModule, __LINE__, ToString(folder).c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_BAD_PARAM);  // over the path error: the request is what is wrong
        return false;
    }
    const auto found = folders_.find(path);
    const bool known = found != folders_.end();
    Folder updated = known ? found->second : Folder();
    if (known) {
        updated.Load(path, folder);
    } else {
        updated.Reload(path, folder);
        folders_.emplace(path, updated);
        if (folders_.size() > internal::kMaxFolders) {
            syslog(LOG_ERR, "%s:%d Exceed max folder size", kFoldersModule, __LINE__);
            ErrorHandler::SetError(FILEINDEX_ERR_EXCEED_MAX_FOLDER);
            return false;
        }
    }
    const Folder *before = GoverningFolder(folders_, fullPath, path, known ? &found->second : nullptr);
    // After the change the record itself counts, even where a folder later in the list governs the path.
    out = ChangeReport(before, &updated);
    if (known) {
        found->second = std::move(updated);
    }
    return true;
}

bool Folders::Delete(Json::Value &out, const std::string &path) {
    const auto removed = folders_.extract(path);
    std::string fullPath;
    if (!GetFullPath(fullPath, path)) {
        return true;  // a folder of a share that is gone can still be removed
    }
    const Folder *before = GoverningFolder(folders_, fullPath, path, removed ? &removed.mapped() : nullptr);
    const Folder *after = GoverningFolder(folders_, fullPath, path, nullptr);
    out = Json::Value(Json::objectValue);
    out[path] = ChangeReport(before, after);
    return true;
}

Json::Value GetMostSuitableCfg(std::vector<Folder> folders, const std::string &path) {
    internal::Governing governing(path);
    for (const Folder &folder : folders) {
        governing.Consider(folder);
    }
    const Folder *folder = governing.Get();
    return folder != nullptr ? folder->asJson() : Json::Value(Json::objectValue);
}

}  // namespace FILEINDEX
}  // namespace VORK
