#include "base/json/text.h"
#include "folders/coverage.h"
#include "folders/media_kinds.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"

#include <fileindex/error.h>
#include <fileindex/folders.h>
#include <fileindex/json_access.h>
#include <fileindex/paths.h>

#include <syslog.h>

#include <algorithm>
#include <utility>

namespace VORK {
namespace FILEINDEX {

using internal::kFoldersModule;

namespace {

using FolderMap = std::map<std::string, Folder>;

/// The folder that governs the full path, null when there is none; `leftOut` counts as not stored. Looked for from
/// the end, as the last one that covers governs; but where some folder has no full path all are asked, in the
/// list's order, because each of those is tried again and leaves its record.
const Folder *GoverningIn(const FolderMap &folders, const std::string &fullPath, bool allResolved,
                          const Folder *leftOut = nullptr) {
    if (allResolved) {
        const auto found = std::find_if(folders.rbegin(), folders.rend(), [&](const auto &entry) {
            return &entry.second != leftOut && internal::Covers(entry.second, fullPath);
        });
        return found == folders.rend() ? nullptr : &found->second;
    }
    internal::Governing governing(fullPath);
    for (const auto &[path, folder] : folders) {
        if (&folder != leftOut) {
            governing.Consider(folder);
        }
    }
    return governing.Get();
}

int Unresolved(const Folder &folder) {
    return internal::FolderAccess::StoredFullPath(folder).empty() ? 1 : 0;
}

/// True for each media kind that is indexed differently after the change. A side that no folder governs always
/// counts as a difference.
Json::Value ChangeReport(const Folder *before, const Folder *after) {
    Json::Value report(Json::objectValue);
    for (const auto &[key, flag] : internal::kMediaKinds) {
        report[key] = before == nullptr || after == nullptr || before->*flag != after->*flag;
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
    return internal::NoThrow([&] {
        const auto found = folders_.find(path);
        if (found == folders_.end()) {
            syslog(LOG_ERR, "%s:%d No such folder: %s", kFoldersModule, __LINE__, path.c_str());
            ErrorHandler::SetError(FILEINDEX_ERR_NO_SUCH_FOLDER);
            return false;
        }
        out = found->second.asJson();
        return true;
    });
}

bool Folders::List(std::vector<Folder> &out) {
    return List(out, std::string());
}

bool Folders::List(std::vector<Folder> &out, const std::string &share) {
    return internal::NoThrow([&] {
        // May be a field of the list that is cleared now.
        const std::string wanted = share;  // NOLINT(performance-unnecessary-copy-initialization)
        out.clear();
        for (const auto &[path, folder] : folders_) {
            std::string owner;
            if (wanted.empty() || (GetShareNameByPath(owner, folder.path) && owner == wanted)) {
                out.push_back(folder);
            }
        }
        return true;
    });
}

bool Folders::Upsert(Json::Value &out, const Json::Value &folder) {
    return internal::NoThrow([&] {
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
        updated.Load(path, folder);
        const bool allResolved = unresolved_ == 0;
        const Folder *added = nullptr;
        if (!known) {
            added = &folders_.emplace(path, updated).first->second;
            unresolved_ += Unresolved(updated);
            if (folders_.size() > internal::kMaxFolders) {
                syslog(LOG_ERR, "%s:%d Exceed max folder size", kFoldersModule, __LINE__);
                ErrorHandler::SetError(FILEINDEX_ERR_EXCEED_MAX_FOLDER);
                return false;
            }
        }
        // After the change the record itself counts, even where a folder later in the list governs the path.
        out = ChangeReport(GoverningIn(folders_, fullPath, allResolved, added), &updated);
        if (known) {
            unresolved_ += Unresolved(updated) - Unresolved(found->second);
            found->second = std::move(updated);
        }
        return true;
    });
}

bool Folders::Delete(Json::Value &out, const std::string &path) {
    return internal::NoThrow([&] {
        const auto found = folders_.find(path);
        const bool known = found != folders_.end();
        std::string fullPath;
        if (GetFullPath(fullPath, path)) {  // a folder of a share that is gone can be removed all the same
            const Folder *own = known ? &found->second : nullptr;
            const bool othersResolved = unresolved_ == (known ? Unresolved(*own) : 0);
            const Folder *before = GoverningIn(folders_, fullPath, unresolved_ == 0);
            const Folder *after = GoverningIn(folders_, fullPath, othersResolved, own);
            out = Json::Value(Json::objectValue);
            out[path] = ChangeReport(before, after);
        }
        if (known) {
            unresolved_ -= Unresolved(found->second);
            folders_.erase(found);
        }
        return true;
    });
}

// Taken by value since the first release; programs are linked with it.
// NOLINTNEXTLINE(performance-unnecessary-value-param)
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
