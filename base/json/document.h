/// \file
/// Documents that people may edit or read: parsed strictly, since what the library's dialect lets pass may be a
/// slip there.
#pragma once

#include <json/value.h>

#include <optional>
#include <string>
#include <string_view>

namespace VORK {

/// One array or object, at most 256 levels deep: no comments, no trailing text, no member twice. Nothing when the
/// text is anything else; `problems` then says why, unless it is nested too deeply.
std::optional<Json::Value> ParseStrictly(std::string_view text, std::string *problems = nullptr);

/// The same for one object.
std::optional<Json::Value> ParseObject(std::string_view text);

/// Text with a final newline, on one line without an indentation: members sorted, bytes of strings as they are.
std::string FormatDocument(const Json::Value &document, const char *indentation = "  ");

}  // namespace VORK
