/// \file
/// Text for people: from any bytes to lines that do no harm to a terminal or a table. Needs no locale.
#pragma once

#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

/// The text with what a terminal would obey written as escapes ("\n", "\x1b"): control characters, those that
/// change the direction of writing, and bytes that are not UTF-8. What is printable already stays as it is.
std::string Printable(const std::string &text);

/// The text in double quotes.
std::string Quoted(const std::string &text);

/// The text as one word of a shell command.
std::string ShellWord(const std::string &text);

/// "a, b and c".
std::string Enumerate(const std::vector<std::string> &items);

using Rows = std::vector<std::vector<std::string>>;

/// Rows with their columns aligned. Cells are made printable. With a `width`, no row exceeds it: the widest
/// columns are shortened, paths at the front and other texts at the end; 0 leaves everything whole.
std::vector<std::string> Align(Rows rows, unsigned width);

}  // namespace VORK::FILEINDEXCTL
