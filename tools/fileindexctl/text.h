/// \file
/// Text for people: any bytes in, lines that keep a terminal and a table in order out. Needs no locale.
#ifndef FILEINDEXCTL_TEXT_H
#define FILEINDEXCTL_TEXT_H

#include <string>
#include <vector>

namespace fileindexctl {

/// The text with control characters written as escapes ("\n", "\x1b"): a name holds no second line and moves no
/// cursor. Bytes that are not UTF-8 pass.
std::string Printable(const std::string &text);

/// The text with each byte that is not UTF-8 written as an escape: "\xe9".
std::string AsUtf8(const std::string &text);

/// The columns the text takes on a terminal; for bytes that are not UTF-8, their number.
unsigned DisplayWidth(const std::string &text);

/// The end of the text, with "..." in front, so that it takes at most `width` columns.
std::string ShortenFront(const std::string &text, unsigned width);

/// The text in double quotes.
std::string Quoted(const std::string &text);

/// The text as one word of a shell command.
std::string ShellWord(const std::string &text);

/// "a, b and c".
std::string Enumerate(const std::vector<std::string> &items);

/// Rows with their columns aligned. Cells are made printable. With a `width`, the cells of the first column are
/// shortened at the front until the rows fit; 0 leaves everything whole.
std::vector<std::string> Align(std::vector<std::vector<std::string>> rows, unsigned width);

}  // namespace fileindexctl

#endif
