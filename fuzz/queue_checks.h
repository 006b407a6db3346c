/// \file
/// Every way of reading a queue file against a plain one, line by line.
#ifndef FILEINDEX_FUZZ_QUEUE_CHECKS_H
#define FILEINDEX_FUZZ_QUEUE_CHECKS_H

#include <cstddef>
#include <string_view>

namespace fileindex_fuzz {

/// Reads the queue whole, and in two steps: the first `cut` bytes, and again when the rest has been appended.
void CheckQueue(std::string_view text, std::size_t cut);

}  // namespace fileindex_fuzz

#endif
