/// \file
/// JSON documents on disk: read whole, replaced whole, changed by one process at a time.
#pragma once

#include "base/unique_fd.h"
#include "base/whole_file.h"

#include <json/value.h>

#include <optional>
#include <string>
#include <utility>

namespace VORK::PLATFORM {

/// Parses one JSON object, strictly: no comments, no trailing text, no member twice. Nothing when the text is
/// anything else.
std::optional<Json::Value> ParseObject(const std::string &text);

/// Indented text with a final newline, members sorted, bytes of strings as they are.
std::string FormatDocument(const Json::Value &document);

/// Puts `text` in the place of the file in one step that survives a crash: a reader sees the old text or the new
/// one. Keeps mode and owner of a file that exists (a link is followed), gives a new one `mode`. False with
/// errno set on failure; the file is then as it was.
///
/// The temporary file beside it has a fixed name, so that a crash leaves no more than one: hold the lock.
bool ReplaceFile(const std::string &path, const std::string &text, unsigned int mode);

/// A lock that was taken. It is given up by name at the end: a child that the host forked meanwhile may have a
/// copy of the descriptor, and closing ours alone would leave the lock with the child.
class FileLock {
public:
    explicit FileLock(UniqueFd file) : file_(std::move(file)) {}
    FileLock(FileLock &&) noexcept = default;
    FileLock &operator=(FileLock &&) = delete;
    ~FileLock();

private:
    UniqueFd file_;
};

/// Takes the exclusive lock on the lock file, making the file when needed. Waits two seconds at most: the
/// callers' own callers hold locks. Nothing, with errno set (ETIMEDOUT when others kept it), on failure.
std::optional<FileLock> TakeLock(const std::string &lockPath);

}  // namespace VORK::PLATFORM
