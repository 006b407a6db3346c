/// \file
/// What the doctor finds, and what it can do about it.
#pragma once

#include "facts/paths.h"
#include "facts/patience.h"

#include <vork/share.h>

#include <json/value.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL::DOCTOR {

struct Repair {
    std::string target;                   ///< the file that changes, or the service
    std::string does;                     ///< what it does with the target: "gives it mode 0600"
    std::vector<std::string> difference;  ///< "- ..." what is, "+ ..." what will be

    /// Mends it; answers the name under which the former state is kept, if it is. Throws Failure. Not there:
    /// `edit` is.
    std::function<std::string(Patience &)> act{};

    /// A change to the document of status.conf, if it still has that fault. All of these are made in one go.
    std::function<void(Json::Value &)> edit{};

    bool replaces = false;  ///< does `edit` do without the former document, which may not even parse?
};

using Repairs = std::vector<Repair>;

enum class Level {
    kWrong,
    kNote,        ///< may be as somebody wants it, or does not matter on this machine
    kUnexamined,  ///< could not be looked at, mostly for want of rights
};

struct Finding {
    std::string what;    ///< without the items
    std::string why;     ///< why it matters
    std::string remedy;  ///< "%" stands for the item, as a word of a shell command
    Repairs repairs{};
    Level level = Level::kWrong;

    /// The files, folders or shares it is about. Findings that differ in nothing else become one.
    std::vector<std::string> items{};
};

using Findings = std::vector<Finding>;

void Append(Findings &findings, const Findings &more);

/// What this user may not look at.
Finding NotAllowed(const std::string &what, const std::vector<std::string> &items = {});

/// What several checks look at. A configuration that cannot be read leaves it empty; its own check reports that.
struct Facts {
    Folders folders{};
    bool areFoldersKnown = false;
    Json::Value status{Json::objectValue};          ///< the document of status.conf
    std::vector<std::string> configuredShares{};    ///< by the platform's configuration
    bool areSharesKnown = false;                    ///< all of them: its every entry is understood and usable
    std::map<std::string, unsigned> folderCount{};  ///< by share
};

struct Check {
    const char *name;
    Findings (*run)(const Facts &);
    bool needsFolders;  ///< it looks at nothing when the folders are not known
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
Findings CheckFlags(const Facts &facts);

// queues.cpp
Findings CheckQueues(const Facts &facts);

/// The path of the share's queue. Asking the library for it would make or take over the directory.
std::string QueueOf(const VORKSHARE &share);

// monitor.cpp
Findings CheckMonitor(const Facts &facts);

}  // namespace VORK::FILEINDEXCTL::DOCTOR
