#include "command_line/completion.h"

namespace VORK::FILEINDEXCTL {

namespace {

// Words are compared one by one: "compgen -W" would expand what stands in the name of a folder.
constexpr const char *kHead = R"bash(# bash completion for fileindexctl, made by "fileindexctl completion bash".

_fileindexctl_offer() {
    local kind
    case $1 in
    PATH) fileindexctl list --paths 2>/dev/null ;;
    ENTRY)
        fileindexctl list --paths 2>/dev/null
        [[ $2 != /* ]] || compgen -f -- "$2"
        ;;
    PLACE) fileindexctl places "$2" 2>/dev/null ;;
    SHARE) fileindexctl list --paths 2>/dev/null | cut -d / -f 2 | sort -u ;;
    FILE) compgen -f -- "$2" ;;
    KINDS)
        [[ $2 == *,* ]] || printf '%s\n' all none
        for kind in )bash";

constexpr const char *kBehindKinds = R"bash(; do
            printf '%s\n' "${2%"${2##*,}"}$kind"
        done
        ;;
    *) tr ' ' '\n' <<<"$1" ;;
    esac
}

_fileindexctl() {
    local cur=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
    local verb='' offer='' options='--json --help' word='' many='' i count=0
    local -a takes=()
    local -A values=()
    COMPREPLY=()

    for ((i = 1; i < COMP_CWORD; ++i)); do
        [[ ${COMP_WORDS[i]} != -* ]] || continue
        verb+=${verb:+ }${COMP_WORDS[i]}
        [[ $verb == @()bash";

constexpr const char *kMiddle = R"bash() ]] || break
    done

    case $verb in
)bash";

constexpr const char *kTail = R"bash(    *) return ;;
    esac

    # "--option=value" arrives as three words.
    [[ $cur != '=' ]] || cur=''
    [[ $previous != '=' ]] || previous=${COMP_WORDS[COMP_CWORD - 2]}
    for ((++i; i < COMP_CWORD; ++i)); do
        word=${COMP_WORDS[i]}
        if [[ -n ${values[$word]+set} ]]; then
            [[ ${COMP_WORDS[i + 1]} != '=' ]] || ((++i))
            ((++i))
        elif [[ $word != -* ]]; then
            ((++count))
        fi
    done
    if [[ -n ${values[$previous]+set} ]]; then
        offer=${values[$previous]}
    elif [[ $cur == -* || (${#takes[@]} -le $count && -z $many) ]]; then
        offer=$options
    else
        offer=${takes[count]-$many}
    fi
    [[ -n $offer ]] || return

    # The word as typed: without its quotes.
    cur=${cur#[\"\']}
    cur=${cur//\\/}
    [[ $offer != @(PATH|ENTRY|PLACE|FILE) ]] || compopt -o filenames 2>/dev/null
    [[ $offer != PLACE ]] || compopt -o nospace 2>/dev/null
    while IFS= read -r word; do
        [[ $word != "$cur"* ]] || COMPREPLY+=("$word")
    done < <(_fileindexctl_offer "$offer" "$cur")
}

complete -F _fileindexctl fileindexctl
)bash";

std::string Joined(const std::vector<Word> &words) {
    std::string text;
    for (const auto &word : words) {
        text += (text.empty() ? "" : " ") + std::string(word.word);
    }
    return text;
}

std::string Quoted(std::string_view text) {
    return SingleQuoted(text, "'\\''");
}

std::string CaseOf(const Command &command) {
    std::string options;
    std::string values;
    std::string takes;
    std::string many;
    for (const auto &parameter : command.parameters) {
        const std::string offer = OfferFor(parameter);
        if (!parameter.IsOption()) {
            takes += (takes.empty() ? "" : " ") + Quoted(offer);
            many = parameter.takes == Takes::kMany ? offer : "";
            continue;
        }
        options += std::string(parameter.name) + " ";
        for (const auto &name : {parameter.letter, parameter.name}) {
            if (parameter.takes != Takes::kNothing && !name.empty()) {
                values += " [" + std::string(name) + "]=" + Quoted(offer);
            }
        }
    }
    std::string text = "    " + Quoted(FullName(command)) + ")\n        options='" + options + "'$options\n";
    if (!values.empty()) {
        text += "        values=(" + values.substr(1) + ")\n";
    }
    if (!takes.empty()) {
        text += "        takes=(" + takes + ")\n";
    }
    return text + (many.empty() ? "" : "        many=" + many + "\n") + "        ;;\n";
}

}  // namespace

std::string BashCompletion() {
    std::string groups;
    std::string cases = "    '') takes=(" + Quoted(Joined(WordsOf(""))) + ") options+=' --version' ;;\n";
    for (const auto &group : Groups()) {
        groups += (groups.empty() ? "" : "|") + std::string(group);
        cases += "    " + std::string(group) + ") takes=(" + Quoted(Joined(WordsOf(group))) + ") ;;\n";
    }
    for (const Command *command : OfferedCommands()) {
        cases += CaseOf(*command);
    }
    return std::string(kHead) + kKinds + kBehindKinds + groups + kMiddle + cases + kTail;
}

}  // namespace VORK::FILEINDEXCTL
