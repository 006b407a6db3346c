#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"
#include "share/lookup.h"

#include <fileindex/error.h>
#include <fileindex/indexability.h>
#include <fileindex/paths.h>

#include <vork/error.h>
#include <vork/filesystem.h>
#include <vork/metadata.h>
#include <vork/quota.h>
#include <vork/share.h>

#include <syslog.h>

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <iterator>
#include <string>
#include <string_view>

namespace VORK {
namespace FILEINDEX {

using internal::HasNul;
namespace records = internal::records;

namespace {

// Constants in the program text, so that a thread or a handler that runs at exit finds them as ever.
constexpr std::string_view kSystemPreservedNames[] = {
    ".TemporaryItems", internal::kDatabaseDir, internal::kQueueFile, ".VORKPPSDB", ".DS_Store",
};

constexpr std::string_view kSkippedShares[] = {"surveillance", "NetBackup"};

constexpr unsigned long long kRequiredSpace = 10485760;  // 10 MiB

constexpr int kUnknownFileSystem = -1;
constexpr int kPseudoFileSystem = 12;

template <typename Table>
bool Contains(const Table &table, std::string_view entry) {
    return std::find(std::begin(table), std::end(table), entry) != std::end(table);
}

bool Mentions(const std::string &path, const char *name) {
    return path.find(name) != std::string::npos;
}

// The name alone proves nothing, a user may choose it; the platform confirms.
bool IsInRecycleBin(const std::string &fullPath) {
    return Mentions(fullPath, "#recycle") && VORKShareIsShareRecycle(fullPath.c_str()) != 0;
}

bool IsInSnapshot(const std::string &fullPath) {
    int inSnapshot = 0;
    return Mentions(fullPath, "#snapshot") && VLIBFhsPathInSnapshot(fullPath.c_str(), &inSnapshot) == 0 &&
           inSnapshot == 1;
}

bool IsForeignFileSystem(int type) {
    return VORKFSIsRemoteFS(type) != 0 || VORKFSIsImageFS(type) != 0 || type == kPseudoFileSystem;
}

/// Anything that is no part of the share's own data, or may not be.
bool IsExcludedPlace(const std::string &fullPath) {
    if (IsInRecycleBin(fullPath) || IsInSnapshot(fullPath)) {
        return true;
    }
    const int type = VORKGetFSType(fullPath.c_str(), 0);
    return type == kUnknownFileSystem || IsForeignFileSystem(type);
}

/// A mount point is a volume of its own, except that an encrypted share is mounted in its place.
bool IsForeignMountPoint(const std::string &fullPath, const _tag_VORKSHARE *share) {
    if (VORKFSDirIsMntPoint(fullPath.c_str()) != 1) {
        return false;
    }
    int encryption = 0;
    return VLIBShareIsEncryptionGet(share, &encryption) == 0 && encryption == 0;
}

/// Free of links, "." and "..", doubled and trailing "/".
bool IsRealPath(const std::string &fullPath) {
    char resolved[PATH_MAX] = {};
    return realpath(fullPath.c_str(), resolved) != nullptr && fullPath == resolved;
}

}  // namespace

bool IsSystemPreservedFileName(const std::string &name) {
    return (!HasNul(name) && VORKEAIsHiddenDir(name.c_str()) == 1) || Contains(kSystemPreservedNames, name);
}

bool IsSkipIndex(const std::string &fullPath) {
    return internal::NoThrow([&] {
        if (HasNul(fullPath)) {
            return true;  // there is nothing to index; the platform would answer for another path
        }
        const int type = VORKGetFSType(fullPath.c_str(), 0);
        const std::size_t slash = fullPath.rfind('/');
        if (slash == std::string::npos || IsSystemPreservedFileName(fullPath.substr(slash + 1)) ||
            IsInRecycleBin(fullPath) || IsInSnapshot(fullPath)) {
            return true;
        }
        // Unlike CanFullPathBeIndexed: skipping a file for want of an answer would leave it out of the index for
        // good.
        return type != kUnknownFileSystem && IsForeignFileSystem(type);
    });
}

bool CanPathBeIndexed(const std::string &sharePath) {
    return internal::NoThrow([&] {
        std::string fullPath;
        if (!GetFullPath(fullPath, sharePath)) {
            syslog(LOG_ERR, "%s:%d GetFullPath failed, path=%s", records::kRuleSharePresent.module,
                   records::kRuleSharePresent.line, sharePath.c_str());
            ErrorHandler::SetError(FILEINDEX_ERR_PATH);
            return false;
        }
        return CanFullPathBeIndexed(fullPath);
    });
}

bool CanFullPathBeIndexed(const std::string &fullPath) {
    return internal::NoThrow([&] {
        // The platform is not asked about a path with a NUL: it would answer for another one.
        if (!HasNul(fullPath) && IsExcludedPlace(fullPath)) {
            return false;
        }
        std::string shareName;
        std::string sharePath;
        if (!GetShareNamePathByFullPath(shareName, sharePath, fullPath)) {
            syslog(LOG_ERR, "%s:%d GetShareNamePathByFullPath failed, path=%s", records::kRuleInShare.module,
                   records::kRuleInShare.line, fullPath.c_str());
            return false;
        }
        const internal::Share share = internal::FindShare(shareName);
        if (!share) {
            syslog(LOG_ERR, "%s:%d VORKShareGet failed, share=%s", records::kRuleShareFound.module,
                   records::kRuleShareFound.line, shareName.c_str());
            return false;
        }
        if (!CanShareBeIndexed(share.get())) {
            return false;
        }
        if (IsForeignMountPoint(fullPath, share.get())) {
            syslog(LOG_ERR, "%s:%d Mount point[%s] is not allowed to be indexed", records::kRuleMountPoint.module,
                   records::kRuleMountPoint.line, fullPath.c_str());
            return false;
        }
        if (!IsRealPath(fullPath)) {
            syslog(LOG_ERR, "%s:%d check realpath failed, path=%s", records::kRuleRealPath.module,
                   records::kRuleRealPath.line, fullPath.c_str());
            return false;
        }
        return true;
    });
}

bool CanShareBeIndexed(_tag_VORKSHARE *share) {
    return internal::NoThrow([&] {
        if (share == nullptr || share->szName == nullptr || Contains(kSkippedShares, share->szName)) {
            return false;
        }
        int encrypted = 0;
        int readOnly = 0;
        if (VLIBShareIsEncryptedGet(share, &encrypted) < 0 || VLIBShareIsReadOnlyGet(share, &readOnly) < 0) {
            return false;
        }
        return encrypted == 0 && readOnly == 0;
    });
}

bool IsShareSpaceEnough(const std::string &shareName) {
    return internal::NoThrow([&] {
        const internal::Share share = internal::FindShare(shareName);
        if (!share) {
            syslog(LOG_ERR, "%s:%d VORKShareGet failed, share=%s", records::kSpaceShare.module,
                   records::kSpaceShare.line, shareName.c_str());
            return false;
        }
        if (VORKQuotaIsEnough(0, share->szPath, kRequiredSpace) != 0) {
            return true;
        }
        // A check that failed for another reason must not stop indexing.
        const int error = VLIBCErrGet();
        return error != VORK_ERR_NO_SPACE && error != VORK_ERR_QUOTA;
    });
}

}  // namespace FILEINDEX
}  // namespace VORK
