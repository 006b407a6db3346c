#compdef fileindexctl
# zsh completion for fileindexctl. The program itself knows what may follow.

_fileindexctl() {
    local line word
    local -a before described directories several
    before=("${(@Q)words[2,CURRENT-1]}")
    if [[ $PREFIX == --*=* ]]; then
        before+=("${PREFIX%%=*}")
        compset -P 1 '*='
    fi
    for line in ${(f)"$(fileindexctl offer --line "${before[@]}" "${(Q)PREFIX}" 2>/dev/null)"}; do
        word=${line%%$'\t'*}
        case $line in
        $'\tfiles') _files ;;
        $'\tseveral')
            several=(-qS ,)
            compset -P '*,'
            ;;
        */) directories+=("$word") ;;
        *$'\t'*) described+=("${word//:/\\:}:${line#*$'\t'}") ;;
        *) described+=("${word//:/\\:}") ;;
        esac
    done
    [[ -z $several ]] || described=("${(@)described##*,}")
    compadd -S '' -a directories
    _describe fileindexctl described "${several[@]}"
}

if [[ $funcstack[1] == _fileindexctl ]]; then
    _fileindexctl "$@"
else
    compdef _fileindexctl fileindexctl
fi
