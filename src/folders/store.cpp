#include "base/json/text.h"
#include "folders/coverage.h"
#include "folders/folder_access.h"
#include "names.h"
#include "no_throw.h"
#include "records.h"

#include <fileindex/error.h>
#include <fileindex/folders.h>
#include <fileindex/json_access.h>
#include <fileindex/paths.h>

#include <syslog.h>

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <utility>

namespace VORK {
namespace FILEINDEX {

using internal::kFoldersModule;

namespace {

using FolderMap = std::map<std::string, Folder>;

template <typename Iterator>
const Folder *FirstCovering(Iterator it, Iterator end, const std::string &fullPath) {
    const auto found =
        std::find_if(it, end, [&](const auto &entry) { return internal::Covers(entry.second, fullPath); });
    return found == end ? nullptr : &found->second;
}

/// The store as it was or will be, without a copy of it: the record stored under `path` is `own` (null: none is).
class StoreWith {
public:
    StoreWith(const FolderMap &folders, const std::string &path, const Folder *own)
        : folders_(folders), own_(own), before_(folders.lower_bound(path)), after_(folders.upper_bound(path)) {}

    /// Null when no folder governs the full path. Where some have no full path each folder is asked in the list's
    /// order, because each of those leaves a record; otherwise from the end, as the last one that covers governs.
    const Folder *Governing(const std::string &fullPath, bool allResolved) const {
        return allResolved ? LastCovering(fullPath) : AskAll(fullPath);
    }

private:
    const Folder *AskAll(const std::string &fullPath) const {
        internal::Governing governing(fullPath);
        for (auto it = folders_.begin(); it != before_; ++it) {
            governing.Consider(it->second);
        }
        if (own_ != nullptr) {
            governing.Consider(*own_);
        }
        for (auto it = after_; it != folders_.end(); ++it) {
            governing.Consider(it->second);
        }
        return governing.Get();
    }

    const Folder *LastCovering(const std::string &fullPath) const {
        const Folder *found = FirstCovering(folders_.rbegin(), std::make_reverse_iterator(after_), fullPath);
        if (found == nullptr && own_ != nullptr && internal::Covers(*own_, fullPath)) {
            found = own_;
        }
        return found != nullptr ? found
                                : FirstCovering(std::make_reverse_iterator(before_), folders_.rend(), fullPath);
    }

    const FolderMap &folders_;
    const Folder *own_;
    FolderMap::const_iterator before_;
    FolderMap::const_iterator after_;
};

bool IsUnresolved(const Folder &folder) {
    return internal::FolderAccess::StoredFullPath(folder).empty();
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
        const bool allResolved = unresolved_ == 0;
        const auto found = folders_.find(path);
        const bool known = found != folders_.end();
        Folder updated = known ? found->second : Folder();
        if (known) {
            updated.Load(path, folder);
        } else {
            updated.Reload(path, folder);
            folders_.emplace(path, updated);
            unresolved_ += IsUnresolved(updated) ? 1 : 0;
            if (folders_.size() > internal::kMaxFolders) {
                syslog(LOG_ERR, "%s:%d Exceed max folder size", kFoldersModule, __LINE__);
                ErrorHandler::SetError(FILEINDEX_ERR_EXCEED_MAX_FOLDER);
                return false;
            }
        }
        const StoreWith asItWas(folders_, path, known ? &found->second : nullptr);
        // After the change the record itself counts, even where a folder later in the list governs the path.
        out = ChangeReport(asItWas.Governing(fullPath, allResolved), &updated);
        if (known) {
            unresolved_ += (IsUnresolved(updated) ? 1 : 0) - (IsUnresolved(found->second) ? 1 : 0);
            found->second = std::move(updated);
        }
        return true;
    });
}

bool Folders::Delete(Json::Value &out, const std::string &path) {
    return internal::NoThrow([&] {
        const bool allResolved = unresolved_ == 0;
        const auto removed = folders_.extract(path);
        const Folder *own = removed ? &removed.mapped() : nullptr;
        unresolved_ -= own != nullptr && IsUnresolved(*own) ? 1 : 0;
        std::string fullPath;
        if (!GetFullPath(fullPath, path)) {
            return true;  // a folder of a share that is gone can still be removed
        }
        const Folder *before = StoreWith(folders_, path, own).Governing(fullPath, allResolved);
        const Folder *after = StoreWith(folders_, path, nullptr).Governing(fullPath, unresolved_ == 0);
        out = Json::Value(Json::objectValue);
        out[path] = ChangeReport(before, after);
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
