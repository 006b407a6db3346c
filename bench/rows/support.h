/// \file
/// What several groups of rows need.
#pragma once

#include "data.h"
#include "rows.h"

#include <string>
#include <vector>

namespace bench {

inline constexpr char kAbsent[] = "/share0/absent/folder/that/no/event/is/about";

void Require(bool condition, const char *what);

std::string FullPath(const std::string &sharePath);

/// Reads a file as the library does, and does nothing with it.
void ReadBytes(const std::string &path);

/// Reads every event of a queue.
void ReadEvents(const std::string &queue);

std::vector<Row> FolderRows();
std::vector<Row> QueueRows(std::size_t scale);
std::vector<Row> ServiceRows();
std::vector<Row> ProcessRows(std::size_t scale);

}  // namespace bench
