// Any paths: the path functions and the rule of coverage against their definitions.

#include "base/path_cover.h"
#include "checks.h"

#include <fileindex/folder.h>
#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>
#include <fileindex/paths.h>

namespace fileindex_fuzz {

namespace {

using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every check

constexpr char kUntouched[] = "untouched";

void CheckPath(const std::string &path) {
    std::string share = kUntouched;
    Require(GetShareNameByPath(share, path) == !path.empty(), "share name", path);
    Require(share == (path.empty() ? kUntouched : ShareOf(path)), "another share name", path);

    std::string full = kUntouched;
    const bool known = IsKnown(path) && path.find('\0') == std::string::npos;
    Require(GetFullPath(full, path) == known, "full path", path);
    Require(full == (known ? "/vol1" + path : kUntouched), "another full path", path);
    if (known && path[0] == '/') {
        std::string name;
        std::string directory;
        Require(GetShareNamePathByFullPath(name, directory, full), "the way back", path);
        Require(name == share && directory == "/vol1/" + share, "another way back", path);
    }
}

/// Rules about two paths; the second also serves as a share's name.
void CheckBoth(const std::string &path, const std::string &above) {
    const std::string replaced = path.empty() ? "" : "/" + above + path.substr(1 + ShareOf(path).size());
    Require(ReplaceShareName(path, above) == replaced, "replaced otherwise", path);
    Require(StringStartWith(path, above) == path.starts_with(above), "prefix", path);
    const bool covered = (path + "/").starts_with(above + "/");
    Require(VORK::IsAtOrUnder(path, above) == covered, "coverage", path);
    Folder folder;
    const bool resolved = folder.SetPath(above);
    Require(IndexMgr::IsPathIndexed(path, {folder}) == covered, "path indexed", path);
    Require(IndexMgr::IsPathContainIndexed(above, {folder}), "a path holds itself", above);
    const std::string full = "/vol1" + path;
    const bool governed = resolved && (full + "/").starts_with(folder.GetFullPath() + "/");
    Require(IndexMgr::IsFullPathIndexed(full, {folder}) == governed, "full path indexed", path);
}

void CheckIndexability(const std::string &path) {
    // The platform takes C strings, so a path with a NUL names nothing.
    const bool excluded = path.find('\0') != std::string::npos || path.starts_with("/vol1/a/#recycle") ||
                          path.starts_with("/vol1/a/#snapshot");
    const std::size_t slash = path.rfind('/');
    const bool skipped =
        slash == std::string::npos || excluded || IsSystemPreservedFileName(path.substr(slash + 1));
    Require(IsSkipIndex(path) == skipped, "skipped otherwise", path);
    const bool mayBe = !excluded && path.starts_with("/vol1/") && !path.starts_with("/vol1/ro");
    Require(mayBe || !CanFullPathBeIndexed(path), "must not be indexed", path);
    CanPathBeIndexed(path);
}

}  // namespace

void FeedPaths(Input &input) {
    while (!input.IsEmpty()) {
        const std::string first = input.MaybeSpoilt("Z");
        const std::string second = (input.OneIn(2) ? first : "") + input.MaybeSpoilt("Z");
        for (const std::string &path : {first, second}) {
            CheckPath(path);
            CheckPath("/" + path);
            CheckIndexability(path);
            CheckIndexability("/vol1/" + path);
        }
        CheckBoth(first, second);
        CheckBoth(second, first);
    }
}

}  // namespace fileindex_fuzz
