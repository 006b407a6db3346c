/// \file
/// JSON files that readers may read at any time and writers replace in place, without a temporary file.
#pragma once

#include <string>

namespace VORK::FILEINDEX::internal {

/// Reads the file's document, the old or the new one whole, whatever a writer is doing or was doing when it died.
/// False when the path is not a regular file or cannot be read. Does not follow a link at the path and never
/// blocks.
///
/// `undisturbed` is false when the file's lock stayed busy and two reads without it differed: a writer is at work,
/// and the text may be part old and part new.
bool ReadFile(const std::string &path, std::string &text, bool &undisturbed);

/// Replaces the file's document, or creates the file. True: the text is on the disk. False: the old document
/// stands, and a file that did not exist does not exist.
///
/// The text must be JSON, which holds no NUL. Writers exclude each other by a lock of their own. At whatever
/// instant a writer is killed or the power fails, the file holds the old or the new document.
bool WriteFile(const std::string &path, const std::string &text);

}  // namespace VORK::FILEINDEX::internal
