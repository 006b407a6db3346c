/// \file
/// The shape of the command table (commands.cpp), from which parsing, help, completion and the manual page are
/// made.
#pragma once

#include "command_line/handlers.h"

#include <span>
#include <string>
#include <string_view>

namespace VORK::FILEINDEXCTL {

/// What comes after a parameter's name; for a positional argument, how often it may stand.
enum class Takes {
    kNothing,
    kOne,
    kNumber,
    kOptional,
    kMany,
    kRest,  ///< all that follows, whatever it looks like
};

/// A positional argument ("PATH") or an option ("--share").
struct Parameter {
    std::string_view name;
    Takes takes;
    std::string_view value;  ///< what an option takes, for the help; what completion offers for a positional
                             ///< argument, if its name does not say so
    std::string_view help;
    std::span<const std::string_view> choices{};  ///< the only values allowed; none given: any
    std::string_view letter{};                    ///< a short form of the name: "-o"

    constexpr bool IsOption() const { return name.starts_with("--"); }
    constexpr bool IsRequired() const { return !IsOption() && (takes == Takes::kOne || takes == Takes::kMany); }
};

/// \name What every command takes, and what is taken without one
/// @{
inline constexpr Parameter kJson = {"--json", Takes::kNothing, "", "one JSON document on the standard output"};
inline constexpr Parameter kHelp = {"--help", Takes::kNothing, "", "show help"};
inline constexpr Parameter kVersion = {"--version", Takes::kNothing, "", "show the version"};
/// @}

struct Command {
    std::string_view group;  ///< "share" for "share rename"; empty for a verb that stands alone
    std::string_view name;
    std::string_view help;
    std::span<const Parameter> parameters;
    Handler *run;
    bool hidden = false;  ///< for the build and the completions, not for users
};

/// All commands, in the order in which help shows them.
std::span<const Command> Commands();

/// "share rename"; "list".
std::string FullName(const Command &command);

/// What the commands of a group are about.
std::string_view HelpOfGroup(std::string_view group);

}  // namespace VORK::FILEINDEXCTL
