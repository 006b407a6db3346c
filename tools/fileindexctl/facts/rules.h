/// \file
/// The rules that decide whether a folder may be indexed, one by one and in the library's order, with the fact
/// behind each. The library answers with yes or no; this finds the reason, and never a different answer.
#pragma once

#include "facts/paths.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEXCTL {

enum class RuleResult { kPassed, kFailed, kNotReached };

struct RuleOutcome {
    std::string_view key;    ///< for programs: "mount_point"
    std::string_view label;  ///< for people: "not a mount point"
    RuleResult result;
    std::string fact;
    std::string remedy;  ///< of a failed rule
};

struct Verdict {
    bool indexable;  ///< the library's own answer
    std::vector<RuleOutcome> rules;
    bool explained;  ///< do the rules lead to that answer?

    /// The rule that fails and explains the answer; null when there is none.
    const RuleOutcome *Failed() const;
};

/// Asks the library about the place as it was taken, and looks at the rules. When the two differ, something may
/// have changed in between, so both are asked once more before the verdict counts as not explained.
Verdict Judge(const Place &place);

/// The first part of a full path that cannot be looked at, and why (errno).
struct Unreachable {
    std::string part;
    int error;
};

/// Nothing when the path's file system is known: what lies on a network file system whose server is dead is never
/// touched.
std::optional<Unreachable> FirstUnreachable(const std::string &fullPath);

/// The indexer walks down from a folder and goes into nothing that it passes over: the first such part of the full
/// path, empty when there is none.
std::string FirstPassedOver(const std::string &folder, const std::string &path);

/// What keeps a full path in an indexable folder, or that folder itself, out of the index, in a few words; empty
/// when nothing does.
std::string ObstacleTo(const std::string &path, const std::string &folder);

}  // namespace VORK::FILEINDEXCTL
