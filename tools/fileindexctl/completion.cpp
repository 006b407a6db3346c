#include "completion.h"

#include "handlers.h"

#include <algorithm>
#include <array>

namespace fileindexctl {

std::string OfferFor(const Parameter &parameter) {
    std::string words;
    for (const auto &choice : parameter.choices) {
        words += (words.empty() ? "" : " ") + std::string(choice);
    }
    if (!words.empty()) {
        return words;
    }
    const std::string_view placeholder = parameter.IsOption() ? parameter.value : parameter.name;
    if (placeholder == "OLD" || placeholder == "NEW") {
        return "SHARE";
    }
    constexpr std::array<std::string_view, 4> kOffered = {"PATH", "SHARE", "FILE", "KINDS"};
    const bool isOffered = std::find(kOffered.begin(), kOffered.end(), placeholder) != kOffered.end();
    return isOffered ? std::string(placeholder) : std::string();
}

std::string FullName(const Command &command) {
    return (command.group.empty() ? "" : std::string(command.group) + " ") + std::string(command.name);
}

std::vector<const Command *> OfferedCommands() {
    std::vector<const Command *> offered;
    for (const auto &command : Commands()) {
        if (!command.hidden) {
            offered.push_back(&command);
        }
    }
    return offered;
}

std::vector<Word> WordsOf(std::string_view group) {
    std::vector<Word> words;
    for (const Command *command : OfferedCommands()) {
        if (command->group == group) {
            words.push_back({command->name, command->help});
        } else if (group.empty() && words.back().word != command->group) {
            words.push_back({command->group, HelpOfGroup(command->group)});
        }
    }
    return words;
}

std::vector<std::string_view> Groups() {
    std::vector<std::string_view> groups;
    for (const Command *command : OfferedCommands()) {
        if (!command->group.empty() && std::find(groups.begin(), groups.end(), command->group) == groups.end()) {
            groups.push_back(command->group);
        }
    }
    return groups;
}

std::string SingleQuoted(std::string_view text, std::string_view quote) {
    std::string result = "'";
    for (const char character : text) {
        result += character == '\'' ? std::string(quote) : std::string(1, character);
    }
    return result + "'";
}

ExitStatus WriteCompletion(const Arguments &arguments, Output &output) {
    const std::string shell = arguments.One("SHELL");
    const std::string script = shell == "bash"  ? BashCompletion()
                               : shell == "zsh" ? ZshCompletion()
                                                : FishCompletion();
    output.Data()["shell"] = shell;
    output.Data()["script"] = script;
    output.Text(script);
    return ExitStatus::Done;
}

}  // namespace fileindexctl
