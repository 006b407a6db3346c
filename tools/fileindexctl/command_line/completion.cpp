// What completes command lines in a shell: scripts, and for them the words that may follow what is typed.
#include "command_line/command.h"
#include "command_line/handlers.h"
#include "command_line/texts.h"
#include "facts/paths.h"
#include "facts/platform_file.h"
#include "report/folder_text.h"

#include <fileindex/indexability.h>
#include <fileindex/paths.h>

#include <vork/filesystem.h>

#include <algorithm>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

namespace {

// Each word stands on a line, after a tab what it is for.
void Offer(Output &output, std::string_view word, std::string_view help = {}) {
    if (word.find_first_of("\t\n") == std::string_view::npos) {
        output.Raw(std::string(word) + (help.empty() ? "" : "\t") + std::string(help) + "\n");
    }
}

// A line without a word tells the script what else to do.
void OfferFilesToo(Output &output) {
    Offer(output, "", "files");
}

// What may follow the words of commands: `before` is empty, or the first word of those that have two.
void OfferCommands(std::string_view before, Output &output) {
    std::string_view last;
    for (const auto &command : Commands()) {
        if (command.group == before && !command.hidden) {
            Offer(output, command.name, command.help);
        } else if (before.empty() && command.group != last && !command.group.empty()) {
            Offer(output, command.group, HelpOfGroup(command.group));
        }
        last = command.group;
    }
}

void OfferPaths(Output &output) {
    for (const auto &folder : ReadFolders()) {
        Offer(output, folder.path);
    }
}

void OfferShares(Output &output) {
    for (const auto &share : SharesOf(ReadFolders())) {
        Offer(output, share);
    }
}

// Those that are not among the typed ones. The script lets several of them follow, with commas between.
void OfferKinds(const std::string &typed, Output &output) {
    const std::string given = typed.substr(0, typed.rfind(',') + 1);
    Offer(output, "", "several");
    for (const std::string kind : kMediaKinds) {
        if (("," + given).find("," + kind + ",") == std::string::npos) {
            Offer(output, given + kind);
        }
    }
    if (given.empty()) {
        Offer(output, "all");
        Offer(output, "none");
    }
}

// The shares, or what the indexer would go into in the directory that is typed so far. A share path ends with "/",
// so that the next part can follow.
void OfferPlaces(const std::string &typed, Output &output) {
    const std::string head = typed.substr(0, typed.rfind('/') + 1);
    if (head.size() <= 1) {
        for (const auto &share : ConfiguredShares()) {
            if (IsSharePresent(share)) {
                Offer(output, "/" + share + "/");
            }
        }
        return;
    }
    std::string directory;
    if (!VORK::FILEINDEX::GetFullPath(directory, head.substr(0, head.size() - 1)) ||
        VORKFSIsRemoteFS(VORKGetFSType(directory.c_str(), 0)) != 0) {
        return;  // such a server may never answer
    }
    std::error_code error;
    for (std::filesystem::directory_iterator entry(directory, error), end; !error && entry != end;
         entry.increment(error)) {
        // As the listing tells, for the server of one that is mounted here may be dead.
        if (!entry->is_symlink(error) && entry->is_directory(error) &&
            !VORK::FILEINDEX::IsSkipIndex(entry->path())) {
            Offer(output, head + entry->path().filename().string() + "/");
        }
    }
}

// By what the help calls the value.
void OfferValues(const Parameter &parameter, const std::string &typed, Output &output) {
    const auto value = parameter.IsOption() || !parameter.value.empty() ? parameter.value : parameter.name;
    for (const auto &choice : parameter.choices) {
        Offer(output, choice);
    }
    if (value == "PATH" || value == "ENTRY") {
        OfferPaths(output);
    }
    if (value == "FILE" || (value == "ENTRY" && typed.starts_with('/'))) {
        OfferFilesToo(output);
    }
    if (value == "SHARE" || value == "OLD" || value == "NEW") {
        OfferShares(output);
    }
    if (value == "PLACE") {
        OfferPlaces(typed, output);
    }
    if (value == "KINDS") {
        OfferKinds(typed, output);
    }
    if (value == "COMMAND") {
        OfferCommands("", output);
    }
}

// What is typed, word by word.
class Line {
public:
    void Add(const std::string &word) {
        if (open_) {
            open_ = open_->takes == Takes::kRest ? open_ : std::nullopt;
        } else if (word.starts_with('-') || isNamed_) {
            Take(word);
        } else {
            Name(word);
        }
    }

    // Completes a last word.
    void Complete(const std::string &typed, Output &output) const {
        const bool isOption = typed.starts_with('-');
        const auto next = std::ranges::find_if_not(left_, &Parameter::IsOption);
        if (open_) {
            OfferValues(*open_, typed, output);
        } else if (!isOption && !isNamed_) {
            OfferCommands(name_, output);
        } else if (!isOption && next != left_.end()) {
            OfferValues(*next, typed, output);
        } else {
            OfferOptions(output);
        }
    }

private:
    void Name(const std::string &word) {
        std::erase_if(left_, [](const Parameter &parameter) { return parameter.name == kVersion.name; });
        name_ += (name_.empty() ? "" : " ") + word;
        const auto command = std::ranges::find(Commands(), name_, FullName);
        isNamed_ = command != Commands().end();
        if (isNamed_) {
            left_.insert(left_.begin(), command->parameters.begin(), command->parameters.end());
        }
    }

    void Take(const std::string &word) {
        const std::string option = word.substr(0, word.find('='));
        const auto found = std::ranges::find_if(left_, [&](const Parameter &parameter) {
            return word.starts_with('-') ? parameter.name == option || parameter.letter == option
                                         : !parameter.IsOption();
        });
        if (found == left_.end()) {
            return;
        }
        if (found->IsOption() && found->takes != Takes::kNothing && option == word) {
            open_ = *found;
        }
        if (found->takes != Takes::kMany) {
            left_.erase(found);
        }
    }

    void OfferOptions(Output &output) const {
        for (const auto &parameter : left_) {
            for (const auto &name : {parameter.name, parameter.letter}) {
                if (name.starts_with('-')) {
                    Offer(output, name, parameter.help);
                }
            }
        }
    }

    std::string name_{};                                   // of the command, as far as it goes
    bool isNamed_ = false;                                 // no more words of the name are to come
    std::vector<Parameter> left_{kJson, kHelp, kVersion};  // what may still be given
    std::optional<Parameter> open_{};                      // an option whose value comes next
};

}  // namespace

ExitStatus OfferWords(const Arguments &arguments, Output &output) {
    std::vector<std::string> words = arguments.All("--line");
    const std::string typed = words.back();
    words.pop_back();
    Line line;
    for (const auto &word : words) {
        line.Add(word);
    }
    line.Complete(typed, output);
    return ExitStatus::kDone;
}

ExitStatus WriteCompletion(const Arguments &arguments, Output &output) {
    const std::string shell = arguments.One("SHELL");
    const std::string script(shell == "bash"  ? kBashCompletion
                             : shell == "zsh" ? kZshCompletion
                                              : kFishCompletion);
    output.Data()["shell"] = shell;
    output.Data()["script"] = script;
    output.Raw(script);
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
