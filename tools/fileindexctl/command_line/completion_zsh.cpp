#include "command_line/completion.h"

namespace VORK::FILEINDEXCTL {

namespace {

constexpr const char *kHead = R"zsh(#compdef fileindexctl
# zsh completion for fileindexctl, made by "fileindexctl completion zsh".

_fileindexctl_paths() {
    local -a folders
    folders=(${(f)"$(fileindexctl list --paths 2>/dev/null)"})
    compadd -a folders
}

_fileindexctl_entries() {
    _fileindexctl_paths
    [[ $PREFIX != /* ]] || _files
}

_fileindexctl_places() {
    local -a places
    places=(${(f)"$(fileindexctl places "${(Q)PREFIX}" 2>/dev/null)"})
    compadd -S '' -a places
}

_fileindexctl_shares() {
    local -a folders
    folders=(${(f)"$(fileindexctl list --paths 2>/dev/null)"})
    folders=(${(u)${folders#/}%%/*})
    compadd -a folders
}

)zsh";

constexpr const char *kTail = R"zsh(if [[ $funcstack[1] == _fileindexctl ]]; then
    _fileindexctl "$@"
else
    compdef _fileindexctl fileindexctl
fi
)zsh";

std::string Quoted(std::string_view text) {
    return SingleQuoted(text, "'\\''");
}

// In what _arguments is given these have a meaning of their own.
std::string Escaped(std::string_view text) {
    std::string result;
    for (const char character : text) {
        if (character == '[' || character == ']' || character == ':' || character == '\\') {
            result += '\\';
        }
        result += character;
    }
    return result;
}

std::string ActionOf(const Parameter &parameter) {
    const std::string offer = OfferFor(parameter);
    if (offer == "PATH") {
        return "_fileindexctl_paths";
    }
    if (offer == "ENTRY") {
        return "_fileindexctl_entries";
    }
    if (offer == "PLACE") {
        return "_fileindexctl_places";
    }
    if (offer == "SHARE") {
        return "_fileindexctl_shares";
    }
    if (offer == "KINDS") {
        return " _values -s , kinds all none " + std::string(kKinds);
    }
    if (offer == "FILE") {
        return "_files";
    }
    return offer.empty() ? " " : "(" + offer + ")";
}

std::string ArgumentText(const Parameter &parameter) {
    if (!parameter.IsOption()) {
        const char *position = parameter.takes == Takes::kMany       ? "*:"
                               : parameter.takes == Takes::kOptional ? "::"
                                                                     : ":";
        return Quoted(position + Escaped(parameter.name) + ":" + ActionOf(parameter));
    }
    const std::string help = "[" + Escaped(parameter.help) + "]";
    const std::string value = parameter.takes == Takes::kNothing
                                  ? std::string()
                                  : ":" + Escaped(parameter.value) + ":" + ActionOf(parameter);
    std::string text = Quoted(std::string(parameter.name) + help + value);
    if (!parameter.letter.empty()) {
        text += " " + Quoted(std::string(parameter.letter) + help + value);
    }
    return text;
}

std::string Common() {
    return "'--json[one JSON document on the standard output]' '--help[show help]'";
}

std::string CaseOf(const Command &command) {
    std::string text = "    " + std::string(command.name) + ")\n        _arguments " + Common();
    for (const auto &parameter : command.parameters) {
        text += " \\\n            " + ArgumentText(parameter);
    }
    return text + "\n        ;;\n";
}

// One function for the first word, and one for the second of each group.
std::string FunctionOf(std::string_view group) {
    const std::string name = "_fileindexctl" + (group.empty() ? "" : "_" + std::string(group));
    std::string text = name + "() {\n    local curcontext=$curcontext state line\n    local -a words_here\n" +
                       "    words_here=(\n";
    for (const auto &word : WordsOf(group)) {
        text += "        " + Quoted(std::string(word.word) + ":" + std::string(word.help)) + "\n";
    }
    text += "    )\n    _arguments -C " + Common() + (group.empty() ? " '--version[show the version]'" : "") +
            " '1: :->word' '*:: :->rest'\n" +
            "    case $state in\n    word)\n        _describe command words_here\n" +
            "        return\n        ;;\n    rest) ;;\n    *) return ;;\n    esac\n    case $words[1] in\n";
    for (const Command *command : OfferedCommands()) {
        text += command->group == group ? CaseOf(*command) : "";
    }
    if (group.empty()) {
        for (const auto &other : Groups()) {
            text += "    " + std::string(other) + ") _fileindexctl_" + std::string(other) + " ;;\n";
        }
    }
    return text + "    esac\n}\n\n";
}

}  // namespace

std::string ZshCompletion() {
    std::string text = kHead;
    for (const auto &group : Groups()) {
        text += FunctionOf(group);
    }
    return text + FunctionOf("") + kTail;
}

}  // namespace VORK::FILEINDEXCTL
