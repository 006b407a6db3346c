/// \file
/// Files that are read and replaced whole.
#pragma once

#include <sys/types.h>

#include <optional>
#include <string>
#include <string_view>

namespace VORK {

/// Everything that can be read from the descriptor, up to 64 MiB; nothing, with errno set (EFBIG for more), on
/// failure.
std::optional<std::string> ReadAll(int fd);

/// The whole file; nothing, with errno set, on failure.
std::optional<std::string> ReadFile(const std::string &path);

enum class Replacing {
    kSettings,  ///< written under a lock: the owner stays, and a crash leaves no more than one file, "PATH.tmp"
    kDocument,  ///< of anybody: becomes the caller's; what is written first has a name that no file had
};

/// Puts `text` in the place of the file in one step that survives a crash: a reader sees the old text or the new
/// one. Keeps the mode of a file that exists (a link is followed), gives a new one `modeIfNew`. False with errno
/// set on failure; the file is then as it was.
bool ReplaceFile(const std::string &path, std::string_view text, mode_t modeIfNew, Replacing what);

}  // namespace VORK
