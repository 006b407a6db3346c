/// \file
/// JSON files that readers may read at any time and writers replace in place, without a temporary file.
#ifndef FILEINDEX_SRC_JSON_FILE_H
#define FILEINDEX_SRC_JSON_FILE_H

#include <string>

namespace VORK::FILEINDEX::internal {

/// Reads one whole text, the old or the new one whatever a writer is doing. False when the path is not a regular
/// file or cannot be read. Does not follow a link at the path and never blocks.
///
/// `undisturbed` is false when the file's lock stayed busy and two reads without it differed: a writer is at work,
/// and the text may be part old and part new.
bool ReadFile(const std::string &path, std::string &text, bool &undisturbed);

/// Writes the text over the file's old content, or creates the file. False when that fails; the old content is
/// then back in place, and a file that did not exist does not exist.
///
/// The text must be JSON: blanks behind it do no harm. Writers exclude each other by a lock of their own. A writer
/// killed in the middle leaves the old or the new text as long as both fit a page (4 KiB); beyond that the one
/// write can be cut.
bool WriteFile(const std::string &path, const std::string &text);

}  // namespace VORK::FILEINDEX::internal

#endif
