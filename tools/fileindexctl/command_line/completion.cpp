#include "command_line/completion.h"

#include "command_line/handlers.h"
#include "facts/paths.h"
#include "facts/platform_file.h"

#include <fileindex/indexability.h>
#include <fileindex/paths.h>

#include <vork/filesystem.h>

#include <algorithm>
#include <array>
#include <filesystem>

namespace VORK::FILEINDEXCTL {

std::string OfferFor(const Parameter &parameter) {
    std::string words;
    for (const auto &choice : parameter.choices) {
        words += (words.empty() ? "" : " ") + std::string(choice);
    }
    if (!words.empty()) {
        return words;
    }
    const std::string_view placeholder =
        parameter.IsOption() || !parameter.value.empty() ? parameter.value : parameter.name;
    if (placeholder == "COMMAND" && !parameter.IsOption()) {
        for (const auto &word : WordsOf("")) {
            words += (words.empty() ? "" : " ") + std::string(word.word);
        }
        return words;
    }
    if (placeholder == "OLD" || placeholder == "NEW") {
        return "SHARE";
    }
    constexpr std::array<std::string_view, 6> kOffered = {"PATH", "ENTRY", "PLACE", "SHARE", "FILE", "KINDS"};
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

// For the scripts: the shares, or what the indexer would go into in the directory that the word names so far. A
// share path ends with "/", so that the next part can follow.
ExitStatus WritePlaces(const Arguments &arguments, Output &output) {
    const std::string word = arguments.One("WORD");
    const std::string head = word.substr(0, word.rfind('/') + 1);
    if (head.size() <= 1) {
        for (const auto &share : ConfiguredShares()) {
            output.Raw(IsSharePresent(share) ? "/" + share + "/\n" : "");
        }
        return ExitStatus::kDone;
    }
    std::string directory;
    if (!VORK::FILEINDEX::GetFullPath(directory, head.substr(0, head.size() - 1)) ||
        VORKFSIsRemoteFS(VORKGetFSType(directory.c_str(), 0)) != 0) {
        return ExitStatus::kDone;  // such a server may never answer
    }
    std::error_code error;
    for (std::filesystem::directory_iterator entry(directory, error), end; !error && entry != end;
         entry.increment(error)) {
        // As the listing tells, for the server of one that is mounted here may be dead.
        const std::string name = entry->path().filename();
        const bool isOffered = !entry->is_symlink(error) && entry->is_directory(error) &&
                               name.find('\n') == std::string::npos &&
                               !VORK::FILEINDEX::IsSkipIndex(entry->path());
        output.Raw(isOffered ? head + name + "/\n" : "");
    }
    return ExitStatus::kDone;
}

ExitStatus WriteCompletion(const Arguments &arguments, Output &output) {
    const std::string shell = arguments.One("SHELL");
    const std::string script = shell == "bash"  ? BashCompletion()
                               : shell == "zsh" ? ZshCompletion()
                                                : FishCompletion();
    output.Data()["shell"] = shell;
    output.Data()["script"] = script;
    output.Raw(script);
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
