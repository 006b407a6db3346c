/// \file
/// The lines of a queue file, one after the other.
#pragma once

#include "base/unique_fd.h"

#include <sys/types.h>

#include <cstddef>
#include <string_view>
#include <utility>
#include <vector>

namespace VORK::FILEINDEXCTL {

/// Reads in blocks, since a queue may be large. What is no record is passed over without being kept: a line longer
/// than any record, and a hole, which reads as NULs and can be longer than anybody could read.
class QueueLines {
public:
    struct Line {
        std::string_view text{};  ///< until the next call
        bool passed = false;      ///< too long, or with a hole in it: no text is given
    };

    /// Lines that begin at `size` or after it came later; the last one before it is read to its end.
    QueueLines(UniqueFd file, long long size) : file_(std::move(file)), size_(size) {}

    /// False after the last one, which may lack its newline; a read error ends the lines too.
    bool Next(Line &line);

private:
    bool PassHole();
    bool Fill();

    UniqueFd file_;
    long long size_;
    std::vector<char> buffer_{};
    std::size_t begin_ = 0;  ///< of what is in the buffer and not delivered
    std::size_t end_ = 0;
    off_t read_ = 0;
    bool endsInNul_ = false;
};

}  // namespace VORK::FILEINDEXCTL
