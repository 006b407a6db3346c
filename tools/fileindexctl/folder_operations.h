/// \file
/// The library's changes of the list of folders, step by step.
#ifndef FILEINDEXCTL_FOLDER_OPERATIONS_H
#define FILEINDEXCTL_FOLDER_OPERATIONS_H

#include "paths.h"
#include "steps.h"

#include <json/value.h>

#include <string>
#include <vector>

namespace fileindexctl {

/// Adds or changes the folders of an array of records, all or none. Throws Failure when nothing was done.
StepReport PerformUpsert(const Json::Value &records, Patience &patience);

/// Folders to be removed.
struct Removal {
    std::vector<std::string> present{};  ///< on shares that are there
    std::vector<std::string> away{};     ///< on shares that are not: their queues and monitors cannot be reached

    bool Contains(const std::string &path) const;
    void Add(const std::string &path);
    std::vector<std::string> All() const;
};

/// What the removal means, for a question; `folders` are those before it.
std::string ConsequenceOf(const Removal &removal, const Folders &folders);

/// Removes the folders; the names of steps that save begin with `saved`. Those on shares that are away come last,
/// and only when everything before succeeded: `removed` says what was tried. Throws Failure when nothing was done.
StepReport PerformRemoval(const std::string &saved, const Removal &removal, std::vector<std::string> &removed,
                          Patience &patience);

}  // namespace fileindexctl

#endif
