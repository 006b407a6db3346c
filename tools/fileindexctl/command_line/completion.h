/// \file
/// Scripts that complete command lines in a shell, made from the command table.
#pragma once

#include "command_line/command.h"

#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEXCTL {

std::string BashCompletion();
std::string ZshCompletion();
std::string FishCompletion();

/// \name For the three of them
/// @{

/// What a parameter takes: "PATH" (an indexed folder), "ENTRY" (one, or a full path), "PLACE" (a share path, part
/// by part), "SHARE", "FILE", "KINDS" (kKinds, with commas between), or its choices with blanks between; empty:
/// nothing to offer.
std::string OfferFor(const Parameter &parameter);

/// The kinds of files.
inline constexpr const char *kKinds = "document audio video photo";

/// "share rename"; "list".
std::string FullName(const Command &command);

/// The commands to be offered.
std::vector<const Command *> OfferedCommands();

/// One word of the command line and what it is for: the first word of commands when `group` is empty, the second
/// of those of the group otherwise.
struct Word {
    std::string_view word;
    std::string_view help;
};
std::vector<Word> WordsOf(std::string_view group);

/// The groups, in order.
std::vector<std::string_view> Groups();

/// The text in single quotes, for a shell in which a quote is written as `quote`.
std::string SingleQuoted(std::string_view text, std::string_view quote);
/// @}

}  // namespace VORK::FILEINDEXCTL
