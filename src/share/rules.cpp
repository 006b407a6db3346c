#include "names.h"
#include "no_throw.h"
#include "records.h"
#include "share/location.h"
#include "share/lookup.h"
#include "share/rule_keys.h"

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

using internal::Rule;
namespace records = internal::records;

namespace {

// Constants in the program text, so that a thread or a handler that runs at exit finds them as ever.
constexpr std::string_view kSystemPreservedNames[] = {
    ".TemporaryItems", internal::kDatabaseDir, internal::kQueueFile, ".VORKPPSDB", ".DS_Store",
};

constexpr unsigned long long kRequiredSpace = 10485760;  // 10 MiB

constexpr int kUnknownFileSystem = -1;

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
    return VORKFSIsRemoteFS(type) != 0 || VORKFSIsImageFS(type) != 0 || type == VORK_FS_TYPE_PSEUDO;
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

/// What is known of a place; each rule adds to it for those after it.
struct Place {
    std::string sharePath{};
    std::string fullPath{};
    int type = kUnknownFileSystem;
    std::string shareName{};
    internal::Share found{};
    const _tag_VORKSHARE *share = nullptr;
    int encrypted = 0;
    int readOnly = 0;
};

bool IsSharePresent(Place &place) {
    if (!GetFullPath(place.fullPath, place.sharePath)) {
        syslog(LOG_ERR, "%s:%d GetFullPath failed, path=%s", records::kRuleSharePresent.module,
               records::kRuleSharePresent.line, place.sharePath.c_str());
        ErrorHandler::SetError(FILEINDEX_ERR_PATH);
        return false;
    }
    return true;
}

bool IsOnKnownFileSystem(Place &place) {
    place.type = VORKGetFSType(place.fullPath.c_str(), 0);
    return place.type != kUnknownFileSystem;
}

bool IsInShare(Place &place) {
    std::string sharePath;
    if (!GetShareNamePathByFullPath(place.shareName, sharePath, place.fullPath)) {
        syslog(LOG_ERR, "%s:%d GetShareNamePathByFullPath failed, path=%s", records::kRuleInShare.module,
               records::kRuleInShare.line, place.fullPath.c_str());
        return false;
    }
    return true;
}

bool IsShareFound(Place &place) {
    place.found = internal::FindShare(place.shareName);
    place.share = place.found.get();
    if (place.share == nullptr) {
        syslog(LOG_ERR, "%s:%d VORKShareGet failed, share=%s", records::kRuleShareFound.module,
               records::kRuleShareFound.line, place.shareName.c_str());
        return false;
    }
    return true;
}

bool IsNoMountPoint(Place &place) {
    if (IsForeignMountPoint(place.fullPath, place.share)) {
        syslog(LOG_ERR, "%s:%d Mount point[%s] is not allowed to be indexed", records::kRuleMountPoint.module,
               records::kRuleMountPoint.line, place.fullPath.c_str());
        return false;
    }
    return true;
}

bool HasRealPath(Place &place) {
    if (!IsRealPath(place.fullPath)) {
        syslog(LOG_ERR, "%s:%d check realpath failed, path=%s", records::kRuleRealPath.module,
               records::kRuleRealPath.line, place.fullPath.c_str());
        return false;
    }
    return true;
}

struct Step {
    Rule rule;
    bool (*passes)(Place &place);
};

constexpr Step kSteps[] = {
    {Rule::kSharePresent, IsSharePresent},
    {Rule::kRecycleBin, [](Place &place) { return !IsInRecycleBin(place.fullPath); }},
    {Rule::kSnapshot, [](Place &place) { return !IsInSnapshot(place.fullPath); }},
    {Rule::kKnownFileSystem, IsOnKnownFileSystem},
    {Rule::kLocalFileSystem, [](Place &place) { return VORKFSIsRemoteFS(place.type) == 0; }},
    {Rule::kImage, [](Place &place) { return VORKFSIsImageFS(place.type) == 0; }},
    {Rule::kPseudoFileSystem, [](Place &place) { return place.type != VORK_FS_TYPE_PSEUDO; }},
    {Rule::kInShare, IsInShare},
    {Rule::kShareFound, IsShareFound},
    {Rule::kShareName,
     [](Place &place) {
         return place.share->szName != nullptr && !Contains(internal::kSkippedShares, place.share->szName);
     }},
    {Rule::kEncryptionTold,
     [](Place &place) { return VLIBShareIsEncryptedGet(place.share, &place.encrypted) >= 0; }},
    {Rule::kReadOnlyTold, [](Place &place) { return VLIBShareIsReadOnlyGet(place.share, &place.readOnly) >= 0; }},
    {Rule::kShareUnlocked, [](Place &place) { return place.encrypted == 0; }},
    {Rule::kShareWritable, [](Place &place) { return place.readOnly == 0; }},
    {Rule::kMountPoint, IsNoMountPoint},
    {Rule::kRealPath, HasRealPath},
};
static_assert(internal::FollowsRules(kSteps));

bool Passes(Place &place, Rule first, Rule last = Rule::kRealPath) {
    return std::all_of(std::begin(kSteps), std::end(kSteps), [&](const Step &step) {
        return step.rule < first || step.rule > last || step.passes(place);
    });
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
        // Unlike in CanFullPathBeIndexed: a file that is skipped because the platform cannot tell would stay out
        // of the index for good.
        return type != kUnknownFileSystem && IsForeignFileSystem(type);
    });
}

bool CanPathBeIndexed(const std::string &sharePath) {
    return internal::NoThrow([&] {
        Place place = {.sharePath = sharePath};
        return Passes(place, Rule::kSharePresent);
    });
}

bool CanFullPathBeIndexed(const std::string &fullPath) {
    return internal::NoThrow([&] {
        Place place = {.fullPath = fullPath};
        // The platform is not asked about a path with a NUL: it would answer for another one.
        return Passes(place, HasNul(fullPath) ? Rule::kInShare : Rule::kRecycleBin);
    });
}

bool CanShareBeIndexed(_tag_VORKSHARE *share) {
    return internal::NoThrow([&] {
        Place place = {.share = share};
        return share != nullptr && Passes(place, Rule::kShareName, Rule::kShareWritable);
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
