#include "facts/paths.h"

#include "base/path_cover.h"
#include "facts/platform_file.h"
#include "facts/share_record.h"
#include "report/failure.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/paths.h>

#include <vork/error.h>

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <iterator>

namespace VORK::FILEINDEXCTL {

namespace {

using VORK::FILEINDEX::Folder;

constexpr const char *kWhereSharesAre = "the shares are those of /usr/vork/etc/platform.conf";

std::string WithoutTrailingSlashes(const std::string &path) {
    return path.substr(0, path.find_last_not_of('/') + 1);
}

void RequireAbsolute(const std::string &path) {
    if (path.empty() || path.front() != '/') {
        throw Failure(ExitStatus::kUsage,
                      "\"" + path + "\" is no path: a path begins with \"/\" and a share's name");
    }
}

// Empty when no share holds the full path.
std::string SharePathOf(const std::string &fullPath) {
    const auto share = ShareHolding(fullPath);
    return share ? "/" + share->first + fullPath.substr(share->second.size()) : "";
}

bool IsShareKnown(const std::string &share, const Folders &folders) {
    return IsSharePresent(share) || std::any_of(folders.begin(), folders.end(), [&](const Folder &folder) {
               return ShareOf(folder.path) == share;
           });
}

}  // namespace

Folders ReadFolders() {
    Folders folders;
    ForgetErrors();
    if (!VORK::FILEINDEX::IndexMgr::List(folders)) {
        throw FailureOf(VORK::FILEINDEX::Folders());
    }
    return folders;
}

bool IsSharePresent(const std::string &share) {
    return FindShare(share) != nullptr;
}

std::string ShareOf(const std::string &sharePath) {
    std::string share;
    VORK::FILEINDEX::GetShareNameByPath(share, sharePath);
    return share;
}

std::string ShareOfFullPath(const std::string &fullPath) {
    const std::string path = SharePathOf(fullPath);
    return path.empty() ? path : ShareOf(path);
}

std::set<std::string> SharesOf(const Folders &folders) {
    std::set<std::string> shares;
    for (const auto &folder : folders) {
        shares.insert(ShareOf(folder.path));
    }
    return shares;
}

std::set<std::string> SharesOf(const Paths &sharePaths) {
    std::set<std::string> shares;
    std::transform(sharePaths.begin(), sharePaths.end(), std::inserter(shares, shares.end()), ShareOf);
    return shares;
}

Paths PathsOf(const Json::Value &records) {
    Paths paths;
    for (const auto &record : records) {
        paths.push_back(record["path"].asString());
    }
    return paths;
}

std::string RequireShare(const std::string &share) {
    const SharePointer found = FindShare(share);
    if (found) {
        return found->szPath;
    }
    switch (VLIBCErrGet()) {
        case VORK_ERR_NO_SUCH_SHARE:
        case VORK_ERR_BAD_PARAMETER:
            if (ConfiguredShares().empty()) {
                throw Failure(
                    ExitStatus::kNotConfigured,
                    std::string("the platform knows no shares: none is to be found in ") + kPlatformFile);
            }
            throw Failure(ExitStatus::kNoSuchFolder, "there is no share \"" + share + "\"; " + kWhereSharesAre);
        case VORK_ERR_SHARE_DIRECTORY_NAME:
            throw Failure(ExitStatus::kNotConfigured,
                          "the share \"" + share +
                              "\" cannot be indexed: its directory has another name than the share. Rename "
                              "one of them, or bind mount the directory under the share's name");
        default:
            if (faccessat(AT_FDCWD, kPlatformFile, R_OK, AT_EACCESS) != 0 && errno == EACCES) {
                throw Failure(ExitStatus::kPermission, std::string("no permission for ") + kPlatformFile +
                                                           "; run this as the administrator");
            }
            ReadPlatformFile();  // throws when the whole file is at fault
            throw Failure(ExitStatus::kNotConfigured,
                          "the share \"" + share + "\" cannot be looked up; " + kWhereSharesAre);
    }
}

Place Locate(const std::string &given, const Folders &folders) {
    RequireAbsolute(given);
    Place place{WithoutTrailingSlashes(given), false, {}, {}};
    if (!place.path.empty() && IsShareKnown(ShareOf(place.path), folders)) {
        place.sharePath = place.path;
        VORK::FILEINDEX::GetFullPath(place.fullPath, place.path);
        return place;
    }
    place.isFull = true;
    place.fullPath = place.path;
    place.sharePath = SharePathOf(place.path);
    return place;
}

Place AsFullPath(const Place &place) {
    return place.fullPath.empty() ? place : Place{place.fullPath, true, place.sharePath, place.fullPath};
}

void RequireSharePath(const Place &place) {
    if (place.isFull && !place.sharePath.empty()) {
        throw Failure(ExitStatus::kUsage, "\"" + place.path + "\" is a full path; the share path is needed: \"" +
                                              place.sharePath + "\"");
    }
}

const Folder *FindFolder(const std::string &path, const Folders &folders) {
    const auto found =
        std::find_if(folders.begin(), folders.end(), [&](const Folder &folder) { return folder.path == path; });
    return found == folders.end() ? nullptr : &*found;
}

const Folder &RequireFolder(const std::string &given, const Folders &folders) {
    if (const Folder *exact = FindFolder(given, folders)) {
        return *exact;
    }
    const Place place = Locate(given, folders);
    if (const Folder *stripped = FindFolder(place.path, folders)) {
        return *stripped;
    }
    RequireSharePath(place);
    std::string message = "\"" + place.path + "\" is not an indexed folder";
    const auto covering = Covering(place, folders);
    if (!covering.empty()) {
        message += ", but lies in \"" + covering.back() + "\"";
    }
    throw Failure(ExitStatus::kNoSuchFolder, message + "; \"fileindexctl list\" shows them");
}

bool IsPlain(const std::string &path) {
    const std::string closed = path + "/";
    return closed.find("//") == std::string::npos && closed.find("/./") == std::string::npos &&
           closed.find("/../") == std::string::npos;
}

Place RequirePlain(const std::string &given, const Folders &folders) {
    Place place = Locate(given, folders);
    RequireSharePath(place);
    if (place.path.empty() || !IsPlain(place.path)) {
        throw Failure(ExitStatus::kUsage,
                      "\"" + given +
                          "\" cannot be indexed: write the path without \".\", \"..\" and doubled "
                          "\"/\", beginning with a share's name");
    }
    RequireShare(ShareOf(place.path));
    return place;
}

std::vector<std::string> DownFrom(const std::string &top, const std::string &path) {
    std::vector<std::string> parts;
    for (std::size_t end = 0; end < path.size();) {
        end = std::min(path.find('/', end + 1), path.size());
        if (std::string part = path.substr(0, end); end == path.size() || IsAtOrUnder(part, top)) {
            parts.push_back(std::move(part));
        }
    }
    return parts;
}

namespace {

// Compared in the form of the place. A folder whose share is away has no full path, and lies nowhere.
std::vector<std::string> Select(const Place &place, const Folders &folders,
                                bool (*holds)(std::string_view, std::string_view)) {
    std::vector<std::string> result;
    for (const auto &folder : folders) {
        const std::string path = place.isFull ? folder.GetFullPath() : folder.path;
        if (!path.empty() && holds(place.path, path)) {
            result.push_back(folder.path);
        }
    }
    return result;
}

}  // namespace

std::vector<std::string> Covering(const Place &place, const Folders &folders) {
    return Select(place, folders, IsAtOrUnder);
}

std::vector<std::string> Contained(const Place &place, const Folders &folders) {
    return Select(place, folders,
                  [](std::string_view path, std::string_view folder) { return IsAtOrUnder(folder, path); });
}

}  // namespace VORK::FILEINDEXCTL
