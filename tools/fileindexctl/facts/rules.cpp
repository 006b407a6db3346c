#include "facts/rules.h"

#include "facts/mounts.h"
#include "facts/records.h"
#include "facts/share_record.h"
#include "report/failure.h"
#include "report/text.h"
#include "src/share/rule_keys.h"

#include <fileindex/indexability.h>

#include <vork/error.h>
#include <vork/filesystem.h>

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <optional>

namespace VORK::FILEINDEXCTL {

using VORK::FILEINDEX::internal::FollowsRules;
using VORK::FILEINDEX::internal::kRuleKeys;
using VORK::FILEINDEX::internal::kSkippedShares;
using VORK::FILEINDEX::internal::Rule;
using VORK::FILEINDEX::internal::RuleKey;

namespace {

constexpr int kUnknownType = -1;

struct Finding {
    bool passed;
    std::string fact;
    std::string remedy{};
};

Finding Pass(const std::string &fact) {
    return {true, fact};
}

// What is learnt on the way down the rules.
struct Probe {
    std::string sharePath;
    std::string fullPath;
    int type = kUnknownType;
    std::string shareName{};
    SharePointer share{};
};

bool Mentions(const std::string &path, const char *name) {
    return path.find(name) != std::string::npos;
}

std::string FileSystemOf(const Probe &probe) {
    // A link may have led to a network mount: then the mount that the text names is not the one.
    const bool remote = VORKFSIsRemoteFS(probe.type) != 0;
    const auto mount = remote ? MountAbove(probe.fullPath) : MountOf(probe.fullPath);
    if (!mount || (remote && VORKFSIsRemoteFS(VORKGetFSType(mount->point.c_str(), 0)) == 0)) {
        return remote ? "a network file system, reached through a link" : "cannot be named";
    }
    return MountText(*mount);
}

Finding SharePresent(Probe &probe) {
    const std::string name = ShareOf(probe.sharePath);
    const SharePointer share = FindShare(name);
    if (share) {
        return Pass(Quoted(name) + " is at " + share->szPath);
    }
    if (VLIBCErrGet() == VORK_ERR_SHARE_DIRECTORY_NAME) {
        return {false, "the directory of " + Quoted(name) + " has another name than the share",
                "rename one of them, or bind mount the directory under the share's name"};
    }
    return {false, "there is no share " + Quoted(name),
            "configure the share, or correct the path; \"fileindexctl doctor\" looks at the shares"};
}

Finding OutsideRecycleBin(Probe &probe) {
    if (!Mentions(probe.fullPath, "#recycle")) {
        return Pass("\"#recycle\" is not in the path");
    }
    if (VORKShareIsShareRecycle(probe.fullPath.c_str()) == 0) {
        return Pass("\"#recycle\" is in the path, but is no share's recycle bin");
    }
    return {false, "the path is in a share's recycle bin", "move the folder out of the recycle bin"};
}

Finding OutsideSnapshot(Probe &probe) {
    if (!Mentions(probe.fullPath, "#snapshot")) {
        return Pass("\"#snapshot\" is not in the path");
    }
    int inSnapshot = 0;
    if (VLIBFhsPathInSnapshot(probe.fullPath.c_str(), &inSnapshot) != 0) {
        return Pass("cannot be told, which counts as no");
    }
    if (inSnapshot != 1) {
        return Pass("\"#snapshot\" is in the path, but shows no snapshot");
    }
    return {false, "the path shows a snapshot", "have the live folder indexed instead"};
}

Finding KnownFileSystem(Probe &probe) {
    probe.type = VORKGetFSType(probe.fullPath.c_str(), 0);
    if (probe.type != kUnknownType) {
        return Pass(FileSystemOf(probe));
    }
    if (const auto found = FirstUnreachable(probe.fullPath)) {
        return {false, Quoted(found->part) + ": " + std::strerror(found->error),
                found->error == ENOENT ? "make the folder, or correct the path" : "make the path accessible"};
    }
    return {false, FileSystemOf(probe) + ", is none that the platform knows",
            "keep the folder on a local disk file system"};
}

Finding LocalFileSystem(Probe &probe) {
    if (VORKFSIsRemoteFS(probe.type) == 0) {
        return Pass("local");
    }
    return {false, FileSystemOf(probe), "keep the folder on a local disk; index a remote one on its own server"};
}

Finding NoImage(Probe &probe) {
    if (VORKFSIsImageFS(probe.type) == 0) {
        return Pass("no image");
    }
    return {false, FileSystemOf(probe), "copy the content out of the image into the share"};
}

Finding NoPseudoFileSystem(Probe &probe) {
    if (probe.type != VORK_FS_TYPE_PSEUDO) {
        return Pass("it holds files");
    }
    return {false, FileSystemOf(probe), "choose a folder of files: this file system is the kernel's"};
}

Finding InShare(Probe &probe) {
    const auto share = ShareHolding(probe.fullPath);
    if (!share) {
        return {false, "no share's directory holds the path", "share a directory above it, or move the folder"};
    }
    probe.shareName = share->first;
    return Pass(Quoted(share->first) + " at " + share->second);
}

Finding ShareFound(Probe &probe) {
    probe.share = FindShare(probe.shareName);
    if (probe.share) {
        return Pass(std::string("its directory is ") + probe.share->szPath);
    }
    return {false, "the share " + Quoted(probe.shareName) + " cannot be looked up",
            "\"fileindexctl doctor\" looks at the shares"};
}

Finding ShareNotExcluded(Probe &probe) {
    const std::string name = probe.share->szName;
    if (std::find(std::begin(kSkippedShares), std::end(kSkippedShares), name) == std::end(kSkippedShares)) {
        return Pass(Quoted(name) + " is no such name");
    }
    return {false, "shares with the name " + Quoted(name) + " are never indexed",
            "keep the folder in a share with another name"};
}

Finding Told(int result, const char *what) {
    if (result >= 0) {
        return Pass("answered");
    }
    return {false, std::string("the platform cannot tell whether the share is ") + what,
            "make the share's directory accessible; the system log may say more"};
}

Finding EncryptionTold(Probe &probe) {
    int encrypted = 0;
    return Told(VLIBShareIsEncryptedGet(probe.share.get(), &encrypted), "locked");
}

Finding ReadOnlyTold(Probe &probe) {
    int readOnly = 0;
    return Told(VLIBShareIsReadOnlyGet(probe.share.get(), &readOnly), "read-only");
}

Finding ShareUnlocked(Probe &probe) {
    int encrypted = 0;
    int encryption = 0;
    VLIBShareIsEncryptionGet(probe.share.get(), &encryption);
    if (VLIBShareIsEncryptedGet(probe.share.get(), &encrypted) >= 0 && encrypted == 0) {
        return Pass(encryption == 0 ? "not encrypted" : "encrypted, and unlocked");
    }
    return {false, "the share is encrypted, and locked now", "unlock the share"};
}

Finding ShareWritable(Probe &probe) {
    int readOnly = 0;
    const auto mount = MountOf(probe.share->szPath);
    const std::string where = mount ? ": " + MountText(*mount) + " (" + mount->options + ")" : "";
    if (VLIBShareIsReadOnlyGet(probe.share.get(), &readOnly) >= 0 && readOnly == 0) {
        return Pass("index data can be written" + where);
    }
    return {false, "the share is read-only" + where,
            "make the share writable: mount it so, or clear its read-only flag"};
}

Finding NoMountPoint(Probe &probe) {
    if (VORKFSDirIsMntPoint(probe.fullPath.c_str()) != 1) {
        return Pass("no mount point");
    }
    int encryption = 0;
    if (VLIBShareIsEncryptionGet(probe.share.get(), &encryption) != 0 || encryption != 0) {
        return Pass("a mount point, as the directory of an encrypted share is");
    }
    return {false, "a mount point: " + FileSystemOf(probe), "have the folders below it indexed one by one"};
}

Finding RealPath(Probe &probe) {
    std::array<char, PATH_MAX> resolved{};
    if (realpath(probe.fullPath.c_str(), resolved.data()) == nullptr) {
        return {false, std::string("the path cannot be resolved: ") + std::strerror(errno),
                "make the path accessible"};
    }
    if (probe.fullPath == resolved.data()) {
        return Pass("free of links");
    }
    const std::string remedy = "name the folder by its real path, " + std::string(resolved.data());
    for (const auto &start : DownFrom("", probe.fullPath)) {
        std::array<char, PATH_MAX> target{};
        if (readlink(start.c_str(), target.data(), target.size() - 1) >= 0) {
            return {false, Quoted(start) + " is a link to " + Quoted(target.data()), remedy};
        }
    }
    return {false, "\".\", \"..\", a doubled \"/\" or one at the end is in the path", remedy};
}

struct Explanation {
    Rule rule;
    std::string_view label;
    Finding (*check)(Probe &);
};

constexpr Explanation kExplanations[] = {
    {Rule::kSharePresent, "the path's share is there", SharePresent},
    {Rule::kRecycleBin, "not in a recycle bin", OutsideRecycleBin},
    {Rule::kSnapshot, "not in a snapshot", OutsideSnapshot},
    {Rule::kKnownFileSystem, "on a known file system", KnownFileSystem},
    {Rule::kLocalFileSystem, "not on a network file system", LocalFileSystem},
    {Rule::kImage, "not in an image", NoImage},
    {Rule::kPseudoFileSystem, "not on a kernel file system", NoPseudoFileSystem},
    {Rule::kInShare, "in a share", InShare},
    {Rule::kShareFound, "the share can be looked up", ShareFound},
    {Rule::kShareName, "the share is not left out by name", ShareNotExcluded},
    {Rule::kEncryptionTold, "known whether the share is locked", EncryptionTold},
    {Rule::kReadOnlyTold, "known whether the share is read-only", ReadOnlyTold},
    {Rule::kShareUnlocked, "the share is not locked", ShareUnlocked},
    {Rule::kShareWritable, "the share is not read-only", ShareWritable},
    {Rule::kMountPoint, "not a mount point", NoMountPoint},
    {Rule::kRealPath, "a path without links", RealPath},
};
static_assert(FollowsRules(kExplanations));

const RuleKey &KeyOf(Rule rule) {
    return kRuleKeys[static_cast<std::size_t>(rule)];
}

// The line of the record of the rule that fails, 0 for one without a record; nothing when all pass.
std::optional<int> Run(const Place &place, std::vector<RuleOutcome> &outcomes) {
    Probe probe{place.isFull ? std::string() : place.path, place.fullPath};
    std::optional<int> failed;
    for (const auto &[rule, label, check] : kExplanations) {
        const RuleKey &key = KeyOf(rule);
        if (place.isFull && rule == Rule::kSharePresent) {
            continue;
        }
        if (failed) {
            outcomes.push_back({key.key, label, RuleResult::kNotReached, {}, {}});
            continue;
        }
        const Finding finding = check(probe);
        outcomes.push_back({key.key, label, finding.passed ? RuleResult::kPassed : RuleResult::kFailed,
                            finding.fact, finding.remedy});
        if (!finding.passed) {
            failed = key.record.line;
        }
    }
    return failed;
}

// The record that the library wrote with its refusal names the rule for some of them.
int RecordedRule() {
    const auto *found = std::find_if(std::begin(kRuleKeys), std::end(kRuleKeys), [](const RuleKey &key) {
        return key.record.line != 0 && Records().Find({key.record}) != nullptr;
    });
    return found == std::end(kRuleKeys) ? 0 : found->record.line;
}

bool Ask(const Place &place) {
    return place.isFull ? VORK::FILEINDEX::CanFullPathBeIndexed(place.path)
                        : VORK::FILEINDEX::CanPathBeIndexed(place.path);
}

Verdict JudgeOnce(const Place &place) {
    Verdict verdict{};
    ForgetErrors();
    verdict.indexable = Ask(place);
    const int recorded = RecordedRule();
    const std::optional<int> failed = Run(place, verdict.rules);
    verdict.explained = (verdict.indexable ? !failed : failed == recorded) && Ask(place) == verdict.indexable;
    return verdict;
}

const RuleOutcome *FirstFailed(const std::vector<RuleOutcome> &rules) {
    const auto failed = std::find_if(rules.begin(), rules.end(),
                                     [](const RuleOutcome &rule) { return rule.result == RuleResult::kFailed; });
    return failed == rules.end() ? nullptr : &*failed;
}

}  // namespace

const RuleOutcome *Verdict::Failed() const {
    return explained ? FirstFailed(rules) : nullptr;
}

Verdict Judge(const Place &place) {
    Verdict verdict = JudgeOnce(place);
    return verdict.explained ? verdict : JudgeOnce(place);
}

std::optional<Unreachable> FirstUnreachable(const std::string &fullPath) {
    if (VORKGetFSType(fullPath.c_str(), 0) != kUnknownType) {
        return std::nullopt;
    }
    for (const auto &start : DownFrom("", fullPath)) {
        struct stat status {};
        if (stat(start.c_str(), &status) != 0) {
            return Unreachable{start, errno};
        }
    }
    return std::nullopt;
}

std::string FirstPassedOver(const std::string &folder, const std::string &path) {
    for (const auto &part : DownFrom(folder, path)) {
        if (VORK::FILEINDEX::IsSkipIndex(part)) {
            return part;
        }
    }
    return {};
}

std::string ObstacleTo(const std::string &path, const std::string &folder) {
    const std::string part = FirstPassedOver(folder, path);
    if (!part.empty()) {
        const std::string name = part.substr(part.rfind('/') + 1);
        if (VORK::FILEINDEX::IsSystemPreservedFileName(name)) {
            return Quoted(name) + " is a name of the system's own";
        }
        // What else is passed over fails the first rules of folders too.
        std::vector<RuleOutcome> outcomes;
        Run({part, true, {}, part}, outcomes);
        const RuleOutcome *failed = FirstFailed(outcomes);
        if (failed == nullptr) {
            return "the indexer passes over " + Quoted(part);
        }
        const bool isPlace = failed->key == "recycle_bin" || failed->key == "snapshot";
        return (isPlace ? "" : "it lies on ") + failed->fact;
    }
    if (const auto found = FirstUnreachable(path)) {
        return found->error == ENOENT || found->error == ENOTDIR
                   ? Quoted(found->part) + " does not exist"
                   : Quoted(found->part) + ": " + std::strerror(found->error);
    }
    Probe probe{{}, path};
    const Finding finding = RealPath(probe);
    if (!finding.passed) {
        return finding.fact;
    }
    struct stat status {};
    const bool holds = stat(path.c_str(), &status) == 0 && (S_ISREG(status.st_mode) || S_ISDIR(status.st_mode));
    return holds ? "" : "it is neither a file nor a directory";
}

}  // namespace VORK::FILEINDEXCTL
