#include "base/path_cover.h"
#include "config/unlocker.h"
#include "folders/coverage.h"
#include "folders/folder_access.h"
#include "folders/places.h"
#include "no_throw.h"
#include "records.h"

#include <fileindex/fileidx.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>

#include <syslog.h>

#include <algorithm>

namespace VORK {
namespace FILEINDEX {

using namespace internal;

namespace {

/// Asks the stored folders in list order, without a lock. A folder.conf that cannot be read makes every answer
/// false.
template <typename Question>
bool AnyStored(Question question) {
    return NoThrow([&] {
        FolderPlaces places;
        return places.Load() && std::any_of(places.All().begin(), places.All().end(), question);
    });
}

}  // namespace

bool IndexMgr::IsPathIndexed(const std::string &path, const std::vector<Folder> &folders) {
    return std::any_of(folders.begin(), folders.end(),
                       [&](const Folder &folder) { return IsAtOrUnder(path, folder.path); });
}

bool IndexMgr::IsPathContainIndexed(const std::string &path, const std::vector<Folder> &folders) {
    return std::any_of(folders.begin(), folders.end(),
                       [&](const Folder &folder) { return IsAtOrUnder(folder.path, path); });
}

bool IndexMgr::IsFullPathIndexed(const std::string &path, const std::vector<Folder> &folders) {
    return NoThrow([&] {
        return std::any_of(folders.begin(), folders.end(),
                           [&](const Folder &folder) { return Covers(folder, path); });
    });
}

bool IndexMgr::IsPathIndexed(const std::string &path) {
    return AnyStored([&](const FolderPlace &folder) { return IsAtOrUnder(path, folder.path); });
}

bool IndexMgr::IsPathContainIndexed(const std::string &path) {
    return AnyStored([&](const FolderPlace &folder) { return IsAtOrUnder(folder.path, path); });
}

bool IndexMgr::IsFullPathIndexed(const std::string &path) {
    return AnyStored([&](const FolderPlace &folder) { return Covers(folder, path); });
}

bool IndexMgr::IsShareIndexed(const std::string &share) {
    return AnyStored([&](const FolderPlace &folder) {
        std::string owner;
        const std::string path(folder.path);
        if (!GetShareNameByPath(owner, path)) {
            syslog(LOG_ERR, "%s:%d Failed to get share name from path: %s", kIndexMgrModule, __LINE__,
                   path.c_str());
            return false;
        }
        return owner == share;
    });
}

bool IndexMgr::List(std::vector<Folder> &folders) {
    return NoThrow([&] {
        Folders store;
        return FolderAccess::Load(store) && store.List(folders);
    });
}

bool IndexMgr::List(Json::Value &out, unsigned long offset, unsigned long limit, const std::string &sort_by,
                    const std::string &sort_direction, const Json::Value &additional) {
    return NoThrow([&] {
        Folders store;
        return FolderAccess::Load(store) && store.List(out, offset, limit, sort_by, sort_direction, additional);
    });
}

bool IndexMgr::Get(Json::Value &result, const std::string &path) {
    return NoThrow([&] {
        Folders store;
        const ConfigUnlocker unlocker(store);
        return store.Lock(true) && FolderAccess::Load(store) && store.Get(result, path);
    });
}

}  // namespace FILEINDEX
}  // namespace VORK

using VORK::FILEINDEX::IndexMgr;
using VORK::FILEINDEX::internal::NoThrow;

int FILEIDXIsFullPathIndexed(const char *szPath) {
    return NoThrow([&] { return szPath != nullptr && IndexMgr::IsFullPathIndexed(szPath) ? 1 : 0; });
}

int FILEIDXIsPathIndexed(const char *szPath) {
    return NoThrow([&] { return szPath != nullptr && IndexMgr::IsPathIndexed(szPath) ? 1 : 0; });
}

int FILEIDXIsShareIndexed(const char *szShare) {
    return NoThrow([&] { return szShare != nullptr && IndexMgr::IsShareIndexed(szShare) ? 1 : 0; });
}
