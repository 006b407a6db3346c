/// \file
/// What importing a configuration would change.
#pragma once

#include "facts/configuration.h"
#include "report/output.h"
#include "verbs/folder_operations.h"

#include <optional>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

struct FolderChange {
    Json::Value from;  ///< null for a folder that is added
    Json::Value to;
};

struct FlagChange {
    std::string member;  ///< of status.conf; "marker" for a member with a name of its own
    std::string name;    ///< the share or the marker
    bool value;

    std::string Text() const { return name.empty() ? "\"\"" : name; }
};

struct ImportPlan {
    std::vector<FolderChange> folders{};
    Removal removal{};
    std::vector<std::string> kept{};  ///< folders that are not in the file and stay
    std::vector<FlagChange> flags{};
    long long pausedFrom = -1;
    std::optional<long long> pause{};

    bool IsEmpty() const { return folders.empty() && removal.All().empty() && flags.empty() && !pause; }

    /// Lines for people, "added", "changed", "removed", "kept" and "status" for programs.
    void Show(Output &output) const;
};

/// Compares with what is stored. Throws Failure for what the library would refuse.
ImportPlan PlanImport(const Configuration &wanted, const std::string &source, bool replace);

}  // namespace VORK::FILEINDEXCTL
