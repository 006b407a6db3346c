/// \file
/// What the doctor finds, and what it can do about it.
#pragma once

#include "facts/paths.h"
#include "facts/patience.h"
#include "facts/status_file.h"
#include "report/failure.h"
#include "report/output.h"

#include <json/value.h>

#include <sys/stat.h>

#include <functional>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEXCTL::DOCTOR {

/// Mends something, and sets the name under which the former state is kept, if it is. Throws Failure.
using Action = std::function<void(Patience &patience, std::string &copy)>;

struct Repair {
    std::string target;                   ///< the file that changes, or the service
    std::string does;                     ///< what it does with the target: "gives it mode 0600"
    std::vector<std::string> difference;  ///< "- ..." what is, "+ ..." what will be
    Action act{};

    /// Instead of `act`: changes the document of status.conf, if it still has that fault. All of these are made in
    /// one go.
    std::function<void(Json::Value &)> edit{};

    bool replaces = false;  ///< does `edit` do without the former document, which may not even parse?
};

using Repairs = std::vector<Repair>;

enum class Level {
    kWrong,
    kNote,        ///< may be as somebody wants it, or does not matter on this machine
    kUnexamined,  ///< could not be looked at, mostly for want of rights
};
using enum Level;

using Items = std::vector<std::string>;

struct Finding {
    const char *check;
    Level level;
    std::string what;    ///< without the items
    Items items;         ///< the files, folders or shares it is about
    std::string why;     ///< why it matters
    std::string remedy;  ///< "%" stands for the first item, as a word of a shell command
    Repairs repairs;
};

class Findings {
public:
    /// What is added from now on was found by this check.
    void Begin(const char *check) { check_ = check; }

    /// Findings of a check that differ in nothing but their items become one. A repair that does nothing is none.
    void Add(Level level, const std::string &what, const Items &items, const std::string &why,
             const std::string &remedy, const Repair &repair = {});

    /// What this user may not look at.
    void AddNotAllowed(const std::string &what, const Items &items = {});

    const std::vector<Finding> &All() const { return all_; }

    Repairs AllRepairs() const;

    /// By one check or, without a name, by all.
    std::size_t Count(Level level, std::string_view check) const;

private:
    const char *check_ = "";
    std::vector<Finding> all_;
};

/// What several checks look at. A configuration that cannot be read leaves it empty; its own check reports that.
struct Facts {
    Facts();

    Folders folders{};
    bool areFoldersKnown = true;
    std::set<std::string> indexedShares{};  ///< those with folders
    StatusFile status{};

    Json::Value platform{Json::objectValue};      ///< the platform's configuration
    std::optional<Failure> platformFailure{};     ///< why it could not be read
    std::vector<std::string> configuredShares{};  ///< by it
    bool areSharesKnown = false;                  ///< all of them: its every entry is understood and usable
};

// repairs.cpp

/// Gives the file another name, with the time in it, and answers that. Throws Failure.
std::string SetAside(const std::string &path);

/// The same, for a copy; empty when there is nothing to copy.
std::string KeepCopy(const std::string &path);

/// Makes the changes, keeping a copy beside each file whose content changes. A repair that fails is reported as a
/// warning, and the others go on.
void CarryOut(const Repairs &repairs, Patience &patience, Output &output);

// ownership.cpp

inline constexpr mode_t kNotForOthersToWrite = 0;  ///< and otherwise as it is

/// Sets owner and mode.
Action Correcting(const std::string &path, mode_t mode);

/// Findings about a regular file or a directory that is to belong to root. Nothing for one that is not there, nor
/// for a link. A file with further names is left to people: its owner may have meant another one of them.
/// `mend` may be empty.
void CheckOwnership(const std::string &path, mode_t mode, const std::string &why, const Action &mend,
                    Findings &findings);

/// Why a file may be somebody else's, for a `kind` like "a queue"; empty when it is root's alone.
std::string ForeignText(const struct stat &status, const std::string &kind);

// configuration.cpp
void CheckConfiguration(Facts &facts, Findings &findings);

// locks.cpp
void CheckLocks(Facts &facts, Findings &findings);
void CheckHolders(const std::string &path, const std::string &why, const std::string &remedy, Findings &findings);

// services.cpp
void CheckDaemon(Facts &facts, Findings &findings);
void CheckServices(Facts &facts, Findings &findings);
void CheckSearch(Facts &facts, Findings &findings);
void CheckMonitor(Facts &facts, Findings &findings);

// shares.cpp
void CheckShares(Facts &facts, Findings &findings);
void CheckFlags(Facts &facts, Findings &findings);

// queues.cpp
void CheckQueues(Facts &facts, Findings &findings);

}  // namespace VORK::FILEINDEXCTL::DOCTOR
