/// \file
/// The lines of an event queue file, for everyone who reads one.
///
/// One process takes the file away and others append to it while it is read: each line is seen as it is when the
/// reader gets to it. Lines end in "\n"; a last one without it counts. No lock is taken: writers give up on a
/// queue that stays locked, and lose their event.
#pragma once

#include "base/unique_fd.h"

#include <sys/stat.h>
#include <sys/types.h>

#include <cstddef>
#include <functional>
#include <limits>
#include <memory>
#include <optional>
#include <string_view>

namespace VORK {

struct QueueLine {
    std::string_view
        text{};           ///< without the newline, until the next line; only the beginning of one that is passed
    bool passed = false;  ///< passed over as malformed: longer than 1 MiB, or with a large hole in it
    bool whole = true;    ///< false for a last line without its newline, which may yet grow
    off_t offset = 0;     ///< where it begins in the file
};

/// Reads in blocks and holds no more than one, or one line if that is longer. A hole reads as NULs, which no
/// record holds, and can be longer than anybody could read: a large one is passed over without being read.
class QueueLines {
public:
    static constexpr off_t kNoEnd = std::numeric_limits<off_t>::max();

    /// `file` is opened by MetadataEntry. Begins at `from`, where a line has to begin. Lines that begin at `end`
    /// or after it are left out; the one before them is read to its end.
    explicit QueueLines(UniqueFd file, off_t from = 0, off_t end = kNoEnd);

    /// Leaves out what cannot matter. `mayMatter` is asked about many lines at once, and only if those may matter,
    /// about each of them.
    void SkipUnless(std::function<bool(std::string_view text)> mayMatter) { mayMatter_ = std::move(mayMatter); }

    /// False after the last line; a read error ends them too.
    bool Next(QueueLine &line);

    /// Where the first line begins that has not been read with its newline: the place to go on from later.
    off_t AfterWhole() const { return passedFrom_.value_or(Offset()); }

private:
    off_t Offset() const { return read_ - static_cast<off_t>(filled_ - begin_); }
    bool Passes(QueueLine &line);
    bool PassHole();
    void TakeWhole(QueueLine &line);
    bool TakeRest(QueueLine &line);
    bool Fill();
    void MakeRoom();
    bool Read();
    void FindWhole(std::size_t from);

    UniqueFd file_;
    off_t end_;
    std::function<bool(std::string_view)> mayMatter_;
    std::unique_ptr<char[]> buffer_;
    std::size_t capacity_ = 0;
    std::size_t begin_ = 0;            ///< of what is in the buffer and not taken
    std::size_t whole_ = 0;            ///< after the last whole line in the buffer
    std::size_t filled_ = 0;           ///< after everything in the buffer
    off_t read_;                       ///< how far the file has been read
    std::optional<off_t> passedFrom_;  ///< where the line begins that is being passed over
    bool endsInNul_ = false;
    bool ended_ = false;
};

/// Where the reading of a queue can go on later.
struct QueuePosition {
    dev_t device = 0;
    ino_t inode = 0;
    off_t offset = 0;

    /// No when the file is another one by now or has become shorter: it is read from the start.
    bool IsIn(const struct stat &file) const {
        return file.st_dev == device && file.st_ino == inode && file.st_size >= offset;
    }
};

}  // namespace VORK
