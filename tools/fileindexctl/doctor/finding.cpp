#include "doctor/finding.h"

#include "facts/platform_file.h"

#include <algorithm>

namespace VORK::FILEINDEXCTL::DOCTOR {

namespace {

bool IsOfOneKind(const Finding &one, const Finding &other) {
    return one.check == other.check && !one.items.empty() && !other.items.empty() && one.what == other.what &&
           one.why == other.why && one.remedy == other.remedy && one.level == other.level &&
           one.repairs.empty() == other.repairs.empty();
}

}  // namespace

void Findings::Add(Level level, const std::string &what, const Items &items, const std::string &why,
                   const std::string &remedy, const Repair &repair) {
    Finding added{check_, level, what, items, why, remedy, {}};
    if (repair.act || repair.edit) {
        added.repairs = {repair};
    }
    const auto group =
        std::find_if(all_.begin(), all_.end(), [&](const auto &other) { return IsOfOneKind(added, other); });
    if (group == all_.end()) {
        all_.push_back(added);
        return;
    }
    group->items.insert(group->items.end(), items.begin(), items.end());
    group->repairs.insert(group->repairs.end(), added.repairs.begin(), added.repairs.end());
}

void Findings::AddNotAllowed(const std::string &what, const Items &items) {
    Add(kUnexamined, what, items, "this user may not look at it", "run this as the administrator");
}

Repairs Findings::AllRepairs() const {
    Repairs repairs;
    for (const auto &finding : all_) {
        repairs.insert(repairs.end(), finding.repairs.begin(), finding.repairs.end());
    }
    return repairs;
}

std::size_t Findings::Count(Level level, std::string_view check) const {
    return static_cast<std::size_t>(std::count_if(all_.begin(), all_.end(), [&](const Finding &finding) {
        return finding.level == level && (check.empty() || check == finding.check);
    }));
}

Facts::Facts() {
    try {
        folders = ReadFolders();
    } catch (const Failure &) {
        areFoldersKnown = false;  // which the check of the configuration reports
    }
    indexedShares = SharesOf(folders);
    if (!status.Load()) {
        status.Document() = Json::objectValue;
    }
    try {
        platform = ReadPlatformFile();
        configuredShares = ConfiguredShares();
        areSharesKnown = !configuredShares.empty() && UnknownMembers(platform).empty() &&
                         std::ranges::all_of(configuredShares, IsSharePresent);
    } catch (const Failure &failure) {
        platformFailure = failure;
    }
}

}  // namespace VORK::FILEINDEXCTL::DOCTOR
