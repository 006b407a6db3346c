/// \file
/// How far indexing is, as a whole or for one folder, at one moment.
#pragma once

#include "facts/queue.h"
#include "report/gaps.h"
#include "report/text.h"

#include <json/value.h>

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

struct StatusReport {
    std::string state{};  ///< in one word
    Rows facts{};         ///< what it is, and how it stands
    Rows shares{};        ///< tables with a head; empty when there is nothing to tell
    Rows folders{};
    std::map<std::string, Backlog> backlogs{};  ///< by share or, for a report of one folder, by folder
    Json::Value data{Json::objectValue};
    Gaps gaps{};

    unsigned long Queued() const;

    /// What lies beside the queues (".tmp"): "photo (12)", "nothing".
    std::string Taken() const;

    /// `width` as for Align.
    std::vector<std::string> Lines(unsigned width) const;
};

/// Everything or, with a name, one share. Throws Failure.
StatusReport ReportService(const std::string &onlyShare);

/// One indexed folder. Throws Failure.
StatusReport ReportFolder(const std::string &given);

}  // namespace VORK::FILEINDEXCTL
