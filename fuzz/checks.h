/// \file
/// What the fuzz targets share: their one kind of assertion, files, the in-memory platform, and the checks.
#pragma once

#include <cstddef>
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
std::string QueueOf(const std::string &share);

/// Forgets earlier inputs: what the platform and the log have kept, the configuration files and the shares'
/// queues.
void ResetMachine();

/// The commands the daemon got since the last time, each a line; malformed frames end the program.
std::string TakeCommands();

/// The fast reader against the exact one, and the writer against the JSON library's. Each returns whether the fast
/// reader decided, or whether the text is JSON at all.
bool CheckEvent(std::string_view line);
bool CheckFolders(std::string_view text);
bool CheckWriter(std::string_view text);

/// Every way of reading a queue file against a plain one, line by line: the queue whole, and in two steps: the
/// first `cut` bytes, and again when the rest has been appended.
void CheckQueue(const std::string &text, std::size_t cut);

}  // namespace fileindex_fuzz
