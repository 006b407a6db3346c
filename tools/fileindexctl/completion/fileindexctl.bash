# bash completion for fileindexctl. The program itself knows what may follow.

_fileindexctl() {
    local current=${COMP_WORDS[COMP_CWORD]} before=() word line
    # "--option=value" arrives as three words.
    for word in "${COMP_WORDS[@]:1:COMP_CWORD-1}"; do
        [[ $word == '=' ]] || before+=("$word")
    done
    [[ $current != '=' ]] || current=''
    # The word as typed: without its quotes.
    current=${current#[\"\']}
    current=${current//\\/}

    # Words are compared one by one: "compgen -W" would expand what stands in the name of a folder.
    COMPREPLY=()
    while IFS= read -r line; do
        word=${line%%$'\t'*}
        if [[ $line == $'\tfiles' ]]; then
            compopt -o filenames 2>/dev/null
            mapfile -t -O "${#COMPREPLY[@]}" COMPREPLY < <(compgen -f -- "$current")
        elif [[ -n $word && $word == "$current"* ]]; then
            COMPREPLY+=("$word")
        fi
    done < <(fileindexctl offer --line "${before[@]}" "$current" 2>/dev/null)
    [[ ${COMPREPLY[0]-} != /* ]] || compopt -o filenames 2>/dev/null
    [[ ${COMPREPLY[0]-} != */ ]] || compopt -o nospace 2>/dev/null
}

complete -F _fileindexctl fileindexctl
