/// \file
/// Files that are read whole.
#pragma once

#include <optional>
#include <string>

namespace VORK {

/// Everything that can be read from the descriptor, up to 64 MiB; nothing, with errno set, on failure.
std::optional<std::string> ReadAll(int fd);

/// The whole file; nothing, with errno set, on failure.
std::optional<std::string> ReadFile(const std::string &path);

}  // namespace VORK
