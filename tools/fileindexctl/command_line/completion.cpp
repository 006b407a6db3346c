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
#include <set>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

namespace {

struct Offer {
    std::string word;
    std::string_view help{};
};
using Offers = std::vector<Offer>;

// Without a word, the second column tells the script what else to do.
const Offer kFilesToo = {"", "files"};   // to offer files as well
const Offer kSeveral = {"", "several"};  // to let several of the words follow, with commas between

Offers ToOffers(const auto &words) {
    Offers offers;
    for (const auto &word : words) {
        offers.push_back({std::string(word)});
    }
    return offers;
}

// What may follow the words of commands: `before` is empty, or the first word of those that have two.
Offers WordsAfter(std::string_view before) {
    Offers offers;
    std::string_view last;
    for (const auto &command : Commands()) {
        if (command.hidden) {
            continue;
        }
        if (command.group == before) {
            offers.push_back({std::string(command.name), command.help});
        } else if (before.empty() && command.group != last) {
            offers.push_back({std::string(command.group), HelpOfGroup(command.group)});
        }
        last = command.group;
    }
    return offers;
}

Offers FirstWords(const std::string & /*typed*/) {
    return WordsAfter("");
}

Offers Paths(const std::string & /*typed*/) {
    Offers offers;
    for (const auto &folder : ReadFolders()) {
        offers.push_back({folder.path});
    }
    return offers;
}

Offers Entries(const std::string &typed) {
    Offers offers = Paths(typed);
    if (typed.starts_with('/')) {
        offers.push_back(kFilesToo);
    }
    return offers;
}

Offers Shares(const std::string & /*typed*/) {
    return ToOffers(SharesOf(ReadFolders()));
}

Offers Files(const std::string & /*typed*/) {
    return {kFilesToo};
}

// Those that are not among the typed ones.
Offers Kinds(const std::string &typed) {
    const std::string given = typed.substr(0, typed.rfind(',') + 1);
    Offers offers = {kSeveral};
    if (given.empty()) {
        offers.insert(offers.end(), {{"all"}, {"none"}});
    }
    for (const std::string kind : kMediaKinds) {
        if (("," + given).find("," + kind + ",") == std::string::npos) {
            offers.push_back({given + kind});
        }
    }
    return offers;
}

// The shares, or what the indexer would go into in the directory that is typed so far. A share path ends with "/",
// so that the next part can follow.
Offers Places(const std::string &typed) {
    Offers offers;
    const std::string head = typed.substr(0, typed.rfind('/') + 1);
    if (head.size() <= 1) {
        for (const auto &share : ConfiguredShares()) {
            if (IsSharePresent(share)) {
                offers.push_back({"/" + share + "/"});
            }
        }
        return offers;
    }
    std::string directory;
    if (!VORK::FILEINDEX::GetFullPath(directory, head.substr(0, head.size() - 1)) ||
        VORKFSIsRemoteFS(VORKGetFSType(directory.c_str(), 0)) != 0) {
        return offers;  // such a server may never answer
    }
    std::error_code error;
    for (std::filesystem::directory_iterator entry(directory, error), end; !error && entry != end;
         entry.increment(error)) {
        // As the listing tells, for the server of one that is mounted here may be dead.
        if (!entry->is_symlink(error) && entry->is_directory(error) &&
            !VORK::FILEINDEX::IsSkipIndex(entry->path())) {
            offers.push_back({head + entry->path().filename().string() + "/"});
        }
    }
    return offers;
}

// By what the help calls a value.
constexpr struct {
    std::string_view placeholder;
    Offers (*offers)(const std::string &typed);
} kSources[] = {{"PATH", Paths}, {"ENTRY", Entries}, {"PLACE", Places}, {"SHARE", Shares},      {"OLD", Shares},
                {"NEW", Shares}, {"FILE", Files},    {"KINDS", Kinds},  {"COMMAND", FirstWords}};

Offers ValuesOf(const Parameter &parameter, const std::string &typed) {
    const std::string_view placeholder =
        parameter.IsOption() || !parameter.value.empty() ? parameter.value : parameter.name;
    for (const auto &source : kSources) {
        if (source.placeholder == placeholder) {
            return source.offers(typed);
        }
    }
    return ToOffers(parameter.choices);
}

// The words of a line up to the one that is typed.
class Before {
public:
    explicit Before(const std::vector<std::string> &words) {
        for (const auto &word : words) {
            Add(word);
        }
    }

    Offers WhatFollows(const std::string &typed) const {
        if (open_ != nullptr) {
            return ValuesOf(*open_, typed);
        }
        const bool isOption = typed.starts_with('-');
        if (command_ == nullptr) {
            Offers offers = WordsAfter(name_);
            return isOption && !offers.empty() ? Options() : offers;
        }
        const Parameter *next = isOption ? nullptr : NextPositional();
        return next == nullptr ? Options() : ValuesOf(*next, typed);
    }

private:
    void Add(const std::string &word) {
        if (open_ != nullptr) {
            open_ = open_->takes == Takes::kRest ? open_ : nullptr;
        } else if (word.starts_with('-')) {
            const std::string option = word.substr(0, word.find('='));
            options_.insert(option);
            open_ = option == word ? FindValued(option) : nullptr;
        } else if (command_ != nullptr) {
            ++positionals_;
        } else {
            name_ += (name_.empty() ? "" : " ") + word;
            const auto found = std::ranges::find(Commands(), name_, FullName);
            command_ = found == Commands().end() ? nullptr : &*found;
        }
    }

    const Parameter *FindValued(std::string_view option) const {
        for (const auto &parameter : Parameters()) {
            if (parameter.takes != Takes::kNothing && (parameter.name == option || parameter.letter == option)) {
                return &parameter;
            }
        }
        return nullptr;
    }

    const Parameter *NextPositional() const {
        std::size_t left = positionals_;
        for (const auto &parameter : Parameters()) {
            if (!parameter.IsOption() && (left-- == 0 || parameter.takes == Takes::kMany)) {
                return &parameter;
            }
        }
        return nullptr;
    }

    // Those that are not given yet.
    Offers Options() const {
        std::vector<Parameter> parameters(Parameters().begin(), Parameters().end());
        parameters.push_back(kJson);
        parameters.push_back(kHelp);
        if (name_.empty()) {
            parameters.push_back(kVersion);
        }
        Offers offers;
        for (const auto &parameter : parameters) {
            if (!parameter.IsOption() || options_.contains(parameter.name) ||
                options_.contains(parameter.letter)) {
                continue;
            }
            for (const auto &name : {parameter.name, parameter.letter}) {
                if (!name.empty()) {
                    offers.push_back({std::string(name), parameter.help});
                }
            }
        }
        return offers;
    }

    std::span<const Parameter> Parameters() const {
        return command_ == nullptr ? std::span<const Parameter>() : command_->parameters;
    }

    std::string name_{};                // of the command, as far as it goes
    const Command *command_ = nullptr;  // null: more words of its name are to come
    const Parameter *open_ = nullptr;   // the option whose value comes next
    std::size_t positionals_ = 0;       // how many arguments were given
    std::set<std::string, std::less<>> options_{};
};

}  // namespace

ExitStatus OfferWords(const Arguments &arguments, Output &output) {
    std::vector<std::string> words = arguments.All("--line");
    const std::string typed = words.back();
    words.pop_back();
    for (const auto &[word, help] : Before(words).WhatFollows(typed)) {
        const bool isOneWord = word.find_first_of("\t\n") == std::string::npos;
        output.Raw(isOneWord ? word + (help.empty() ? "" : "\t") + std::string(help) + "\n" : "");
    }
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
