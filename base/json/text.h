/// \file
/// JSON text in the library's one dialect: strict JSON, at most 256 levels deep, of repeated members the last.
#pragma once

#include <json/reader.h>
#include <json/value.h>

#include <memory>
#include <string>
#include <string_view>

namespace VORK {

/// Deeper documents have no use here, and a hostile one must not exhaust the stack.
inline constexpr int kMaxJsonDepth = 256;

/// A parser that can be kept for many texts: building one costs more than parsing a short line.
class JsonReader {
public:
    JsonReader();

    /// False when the whole text is not one JSON value; blanks may surround it, nothing else. `out` is then
    /// whatever was read so far. Never throws.
    bool Parse(std::string_view text, Json::Value &out) const;

private:
    std::unique_ptr<Json::CharReader> reader_;
};

/// One line without a newline: members in sorted order, comments left out, every byte of a string that needs no
/// escape unchanged, UTF-8 or not. Of arrays and objects deeper than the dialect has them "..." is left: good for
/// a record, and no JSON.
std::string ToString(const Json::Value &value);

/// Does a reader accept what ToString makes of the value, `levels` deep in another? One that a caller has made may
/// be nested as deep as the caller liked, and have numbers that JSON has not: infinite ones and NaN. To copy it
/// takes as much stack as it is deep; to ask takes little.
bool CanBeWritten(const Json::Value &value, int levels = 0);

/// Appends the JSON string with that content, quotes included.
void AppendQuoted(std::string &out, std::string_view content);

}  // namespace VORK
