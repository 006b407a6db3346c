/// \file
/// The rules by which a place may be indexed, in the order in which they are asked. The library walks them, and
/// fileindexctl explains them one by one.
#pragma once

#include "src/records.h"

#include <cstddef>
#include <string_view>

namespace VORK::FILEINDEX::internal {

enum class Rule {
    kSharePresent,  ///< for a share path only; a full path begins with the next
    kRecycleBin,
    kSnapshot,
    kKnownFileSystem,
    kLocalFileSystem,
    kImage,
    kPseudoFileSystem,
    kInShare,  ///< a path with a NUL begins here
    kShareFound,
    kShareName,  ///< from here to kShareWritable of the share alone
    kEncryptionTold,
    kReadOnlyTold,
    kShareUnlocked,
    kShareWritable,
    kMountPoint,
    kRealPath,
};

struct RuleKey {
    Rule rule;
    const char *key;  ///< for programs
    Record record{};  ///< of the refusal; line 0: it leaves none
};

inline constexpr RuleKey kRuleKeys[] = {
    {Rule::kSharePresent, "share_present", records::kRuleSharePresent},
    {Rule::kRecycleBin, "recycle_bin"},
    {Rule::kSnapshot, "snapshot"},
    {Rule::kKnownFileSystem, "known_file_system"},
    {Rule::kLocalFileSystem, "local_file_system"},
    {Rule::kImage, "image"},
    {Rule::kPseudoFileSystem, "pseudo_file_system"},
    {Rule::kInShare, "in_share", records::kRuleInShare},
    {Rule::kShareFound, "share_found", records::kRuleShareFound},
    {Rule::kShareName, "share_name"},
    {Rule::kEncryptionTold, "encryption_told"},
    {Rule::kReadOnlyTold, "read_only_told"},
    {Rule::kShareUnlocked, "share_unlocked"},
    {Rule::kShareWritable, "share_writable"},
    {Rule::kMountPoint, "mount_point", records::kRuleMountPoint},
    {Rule::kRealPath, "real_path", records::kRuleRealPath},
};

/// The names of shares that are never indexed.
inline constexpr std::string_view kSkippedShares[] = {"surveillance", "NetBackup"};

inline constexpr std::size_t kRules = static_cast<std::size_t>(Rule::kRealPath) + 1;

/// Has the table one row for each rule, in order? Each table of them is held to this when it is compiled.
template <typename Row, std::size_t size>
constexpr bool FollowsRules(const Row (&rows)[size]) {
    for (std::size_t i = 0; i < size; ++i) {
        if (rows[i].rule != static_cast<Rule>(i)) {
            return false;
        }
    }
    return size == kRules;
}

static_assert(FollowsRules(kRuleKeys));

}  // namespace VORK::FILEINDEX::internal
