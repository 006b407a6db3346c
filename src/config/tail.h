/// \file
/// The tail of a configuration file: the whole new document, put after the old one before a byte of that changes.
///
/// JSON text holds no NUL, so nothing from the first NUL of a file on is part of its document. A tail is NULs up
/// to the first page boundary beyond both documents, then the new document, then a trailer at the end of the file
/// with its length and checksum. It shares no page with what is written over the old document, so a crash that
/// cuts one of the two short leaves the other whole. A save ends with cutting it off: a finished file is plain
/// JSON.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace VORK::FILEINDEX::internal {

/// The tail for a file that holds `oldSize` bytes, to be written after them in one write.
std::string TailAfter(std::size_t oldSize, std::string_view document);

enum class FileState {
    kPlain,      ///< no NUL: as every save leaves it
    kWholeTail,  ///< the tail is complete and holds the document, whatever stands before it
    kTorn,       ///< the tail is not complete: what stands before the first NUL is the document
};

struct FileContent {
    FileState state;
    std::string_view document;  ///< a part of the bytes
};

/// What the bytes of a configuration file mean.
FileContent ContentOf(std::string_view bytes);

}  // namespace VORK::FILEINDEX::internal
