/// \file
/// From what the user typed to share paths, full paths and folders.
#pragma once

#include <fileindex/folder.h>

#include <set>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

using Folders = std::vector<VORK::FILEINDEX::Folder>;
using Paths = std::vector<std::string>;

/// All folders, in the order of folder.conf. Throws Failure.
Folders ReadFolders();

/// A path that is asked about, in the form in which it was taken.
struct Place {
    std::string path;       ///< as given, without trailing slashes
    bool isFull;            ///< a full path ("/vol1/photo/2015"), else a share path ("/photo/2015")
    std::string sharePath;  ///< empty for a full path outside all shares
    std::string fullPath;   ///< empty for a share path whose share is away

    const char *TakenAs() const { return isFull ? "full path" : "share path"; }
};

/// A path is a share path when its first component names a share, present or indexed, and a full path otherwise.
/// Throws Failure for one that does not begin with "/".
Place Locate(const std::string &given, const Folders &folders);

/// The folder stored under the path as given or, failing that, without its trailing slashes. Throws Failure, with
/// what the user may have meant, when there is none.
const VORK::FILEINDEX::Folder &RequireFolder(const std::string &given, const Folders &folders);

/// The folder stored under exactly this path; null when there is none.
const VORK::FILEINDEX::Folder *FindFolder(const std::string &path, const Folders &folders);

/// Throws Failure, which names the share path, for a full path.
void RequireSharePath(const Place &place);

/// Is the path spelt without ".", ".." and doubled "/"?
bool IsPlain(const std::string &path);

/// The place that a share path names: on a share that exists, without trailing slashes, spelt plainly. Throws
/// Failure.
Place RequirePlain(const std::string &given, const Folders &folders);

/// The directory of the share. Throws Failure, which says why the share cannot be used.
std::string RequireShare(const std::string &share);

/// The share's name of a share path.
std::string ShareOf(const std::string &sharePath);

/// The share that holds a full path; empty when none does.
std::string ShareOfFullPath(const std::string &fullPath);

/// The names of the shares that the folders lie on.
std::set<std::string> SharesOf(const Folders &folders);

/// The names of the shares of share paths.
std::set<std::string> SharesOf(const Paths &sharePaths);

/// The share paths of an array of folder records.
Paths PathsOf(const Json::Value &records);

bool IsSharePresent(const std::string &share);

/// The full path and what it lies in, the outermost first, from `top` on; from the root when that is empty.
std::vector<std::string> DownFrom(const std::string &top, const std::string &path);

/// The same place in the form of a full path, if it has one: full paths see through shares inside shares.
Place AsFullPath(const Place &place);

/// The indexed folders that the place lies in, itself included.
std::vector<std::string> Covering(const Place &place, const Folders &folders);

/// The indexed folders that lie in the place, itself included.
std::vector<std::string> Contained(const Place &place, const Folders &folders);

}  // namespace VORK::FILEINDEXCTL
