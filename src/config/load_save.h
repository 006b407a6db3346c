/// \file
/// Loading and saving a configuration file, with the records and codes of every failure.
#pragma once

#include <functional>
#include <string>

namespace VORK::FILEINDEX::internal {

/// Parses the file's text, which it may change. False when that is no JSON.
using TextParser = std::function<bool(std::string &text)>;

/// True also when there is no file; then `parse` is not called. Otherwise one record and FILEINDEX_ERR_LOAD_JSON.
bool LoadConfig(const std::string &path, const TextParser &parse);

/// Makes the JSON text; false when there is none that a load would accept.
using TextMaker = std::function<bool(std::string &text)>;

/// Writes the text, mode 0644. On failure one record and FILEINDEX_ERR_SAVE_JSON; the old file stands.
bool SaveConfig(const std::string &path, const TextMaker &make);

}  // namespace VORK::FILEINDEX::internal
