/// \file
/// What the doctor finds, and what it can do about it.
#ifndef FILEINDEXCTL_DOCTOR_FINDING_H
#define FILEINDEXCTL_DOCTOR_FINDING_H

#include "../paths.h"

#include <json/value.h>

#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace fileindexctl::doctor {

struct Repair {
    std::string target;                   ///< the file that changes, or the service
    std::vector<std::string> difference;  ///< "- ..." what is, "+ ..." what will be
    bool keepsCopy = false;               ///< does the content of the target change?

    /// Mends it. Throws Failure. Not there: `edit` is.
    std::function<void()> act{};

    /// A change to the document of status.conf, if it still has that fault. All of these are made in one go.
    std::function<void(Json::Value &)> edit{};

    bool replaces = false;  ///< does `edit` do without the former document, which may not even parse?
};

struct Finding {
    std::string what;
    std::string why;  ///< why it matters
    std::string remedy;
    std::optional<Repair> repair{};
};

using Findings = std::vector<Finding>;

/// What several checks look at. A configuration that cannot be read leaves it empty; its own check reports that.
struct Facts {
    Folders folders{};
    bool areFoldersKnown = false;
    Json::Value status{Json::objectValue};          ///< the document of status.conf
    std::vector<std::string> configuredShares{};    ///< by the platform's configuration
    std::map<std::string, unsigned> folderCount{};  ///< by share
};

struct Check {
    const char *name;
    Findings (*run)(const Facts &);
};

Facts Look();

// configuration.cpp
Findings CheckConfiguration(const Facts &facts);

// locks.cpp
Findings CheckLocks(const Facts &facts);

// services.cpp
Findings CheckDaemon(const Facts &facts);
Findings CheckServices(const Facts &facts);
Findings CheckSearch(const Facts &facts);

// shares.cpp
Findings CheckShares(const Facts &facts);
Findings CheckQueues(const Facts &facts);
Findings CheckFlags(const Facts &facts);

}  // namespace fileindexctl::doctor

#endif
