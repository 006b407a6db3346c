/// \file
/// Realistic folders and queues: paths of 80 to 200 bytes, some not ASCII, some with escapes.
#pragma once

#include <json/value.h>

#include <cstddef>
#include <string>
#include <vector>

namespace bench {

inline constexpr char kVolume[] = "/tmp/bench";
inline constexpr char kFolderConf[] = "/usr/vork/etc/fileindex/folder.conf";

enum class Escapes { kNone, kSome, kEverywhere };

/// Share paths of distinct folders, spread over `shares` shares named share0, share1, ...
std::vector<std::string> SharePaths(std::size_t count, std::size_t shares);

/// An Upsert request for them.
Json::Value Records(const std::vector<std::string> &paths);

/// Writes folder.conf with these folders, as the library would.
void WriteFolderConf(const std::vector<std::string> &paths);

/// The path of a share's queue; its directory exists.
std::string QueuePath(const std::string &share);

/// Writes a queue: of each 100 lines 2 by other writers, and one line in 1000 malformed. No line concerns a path
/// below share0/absent. kEverywhere puts an escape into each path.
void WriteQueue(const std::string &path, std::size_t lines, Escapes escapes = Escapes::kNone);

/// Writes a queue in which every line is well formed and none is ordinary.
void WriteUnusualQueue(const std::string &path, std::size_t lines);

std::string ReadWhole(const std::string &path);

}  // namespace bench
