/// \file
/// What the fuzz targets share: their one kind of assertion, files, and the in-memory platform.
#pragma once

#include "input.h"

#include <string>
#include <string_view>

namespace fileindex_fuzz {

/// Ends the program when the condition does not hold, so that the fuzzer keeps the input.
void Require(bool holds, const char *what, std::string_view about = {});

std::string ReadWhole(const std::string &path);  ///< empty when there is no such file
void WriteWhole(const std::string &path, std::string_view text);

/// The platform's shares with a directory below /vol1. "ro" is read-only.
inline constexpr const char *kShares[] = {"a", "b", "photo", "ro"};

std::string ShareOf(const std::string &path);  ///< what stands between the first character and the next "/"
bool IsKnown(const std::string &path);         ///< is it in one of the shares?
std::string QueueOf(const std::string &share);

/// The commands the daemon got since the last time, each a line; malformed frames end the program.
std::string TakeCommands();

using Target = void(Input &input);
Target FeedReaders, FeedQueue, FeedDocuments, FeedPaths, FeedOperations;

}  // namespace fileindex_fuzz
