#include "command_line/completion.h"

namespace VORK::FILEINDEXCTL {

namespace {

constexpr const char *kHead = R"fish(# fish completion for fileindexctl, made by "fileindexctl completion fish".

# Are the words so far, without options, exactly these?
function __fileindexctl_at
    set -l words (commandline -opc)
    set -e words[1]
    test "$(string join ' ' -- (string match -v -- '-*' $words))" = "$argv"
end

# Do the words so far, without options, begin with these?
function __fileindexctl_in
    set -l words (commandline -opc)
    set -e words[1]
    string match -q -- "$argv *" "$(string join ' ' -- (string match -v -- '-*' $words)) "
end

function __fileindexctl_paths
    fileindexctl list --paths 2>/dev/null
end

function __fileindexctl_entries
    __fileindexctl_paths
    string match -q -- '/*' (commandline -ct); and __fish_complete_path (commandline -ct)
end

function __fileindexctl_places
    fileindexctl places (string unescape -- (commandline -ct)) 2>/dev/null
end

function __fileindexctl_shares
    fileindexctl list --paths 2>/dev/null | string replace -r '^/([^/]*).*' '$1' | sort -u
end

complete -c fileindexctl -f
complete -c fileindexctl -l json -d 'one JSON document on the standard output'
complete -c fileindexctl -l help -d 'show help'
complete -c fileindexctl -n '__fileindexctl_at' -l version -d 'show the version'
)fish";

std::string Quoted(std::string_view text) {
    return SingleQuoted(text, "\\'");
}

// With -F files are offered too.
std::string OfferOf(const Parameter &parameter) {
    const std::string offer = OfferFor(parameter);
    if (offer == "PATH") {
        return " -a '(__fileindexctl_paths)'";
    }
    if (offer == "ENTRY") {
        return " -a '(__fileindexctl_entries)'";
    }
    if (offer == "PLACE") {
        return " -a '(__fileindexctl_places)'";
    }
    if (offer == "SHARE") {
        return " -a '(__fileindexctl_shares)'";
    }
    if (offer == "KINDS") {
        return " -a 'all none (__fish_append , " + std::string(kKinds) + ")'";
    }
    if (offer == "FILE") {
        return " -F";
    }
    return offer.empty() ? "" : " -a " + Quoted(offer);
}

std::string Line(const std::string &condition, const std::string &rest, std::string_view help) {
    return "complete -c fileindexctl -n " + Quoted(condition) + rest + " -d " + Quoted(help) + "\n";
}

std::string LineOf(const std::string &condition, const Parameter &parameter) {
    const std::string offer = OfferOf(parameter);
    if (!parameter.IsOption()) {
        return offer.empty() ? offer : Line(condition, offer, parameter.name);
    }
    const std::string letter =
        parameter.letter.empty() ? std::string() : " -s " + std::string(parameter.letter.substr(1));
    const std::string needs = offer.starts_with(" -F") ? " -r" : " -x";
    const std::string value = parameter.takes == Takes::kNothing ? std::string() : needs + offer;
    return Line(condition, letter + " -l " + std::string(parameter.name.substr(2)) + value, parameter.help);
}

}  // namespace

std::string FishCompletion() {
    std::string text = kHead;
    for (const auto &word : WordsOf("")) {
        text += Line("__fileindexctl_at", " -a " + std::string(word.word), word.help);
    }
    for (const auto &group : Groups()) {
        for (const auto &word : WordsOf(group)) {
            text += Line("__fileindexctl_at " + std::string(group), " -a " + std::string(word.word), word.help);
        }
    }
    for (const Command *command : OfferedCommands()) {
        for (const auto &parameter : command->parameters) {
            text += LineOf("__fileindexctl_in " + FullName(*command), parameter);
        }
    }
    return text;
}

}  // namespace VORK::FILEINDEXCTL
