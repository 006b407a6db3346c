#!/bin/bash
# What is made from the table of commands for other programs: completions, run in the shells that are there, and the
# manual page.
# shellcheck disable=SC2016,SC2317  # words for other shells; functions are called through their names
set -uo pipefail

export PATH="$BIN_DIR:$PATH"
failures=0

expect() {
    local what=$1 expected=$2 found=$3
    [[ $found == "$expected" ]] && return
    printf '%s:\n%s\n' "$what" "$(diff <(echo "$expected") <(echo "$found"))"
    failures=$((failures + 1))
}

# A folder's name must be completed, not run.
cat >/usr/vork/etc/fileindex/folder.conf <<'END'
{"/music": {}, "/photo/$(touch /tmp/hacked)": {}, "/photo/a b": {}, "/photo/*": {}}
END
echo '{"shares": {"photo": {"path": "/vol1/photo"}, "video": {"path": "/vol1/video"}, "odd": {"path": "/vol1/even"}}}' \
    >/usr/vork/etc/platform.conf
mkdir -p /vol1/video /vol1/photo/@eaDir '/vol1/photo/2015/a b' /vol1/photo/2015/c && touch /vol1/photo/2015/file
mkdir /tmp/files && cd /tmp/files && touch "one file" two

# What is typed after "fileindexctl", "|", what is offered.
rows=(
    'qu|queue'
    'queue |count,show'
    'share re|remove,rename,resume'
    'completion |bash,fish,zsh'
    'list --sh|--share'
    'list --sort p|path,photo'
    'list --share |music,photo'
    'list --limit |'
    '--json share rename p|photo'
    'share rename photo m|music'
    'show /mu|/music'
    'show /music --j|--json'
    'remove --yes /music /photo/a|/photo/a b'
    'check tw|'
    'check /tmp/files/o|/tmp/files/one file'
    'show tw|'
    'remove /tmp/files/o|'
    'export -o t|two'
    'import |one file,two'
    'add |/photo/,/video/'
    'add /photo/|/photo/2015/'
    'add /photo/2015/a|/photo/2015/a b/'
    'reindex /video /photo/2015/|/photo/2015/a b/,/photo/2015/c/'
    'add /photo --media a|all,audio'
    'resume |--help,--json,--wait'
    'resume --wait 3 --|--help,--json'
    'export -|--help,--json,--output,-o'
    'help qu|queue'
    'pause --run show |'
    'nonsense |'
)
notBash=(
    'list --sort=p|--sort=path,--sort=photo'
    'export --output=t|--output=two'
)
onlyBash=(
    'list --sort=p|path,photo'
    'remove --yes /music /photo/$|/photo/$(touch /tmp/hacked)'
    'show /photo/a\ |/photo/a b'
    'show "/photo/a|/photo/a b'
)

# shellcheck disable=SC1090,SC2001,SC2034  # the function reads COMP_WORDS
in_bash() {
    source <(fileindexctl completion bash)
    local line="fileindexctl ${1/=/ = }"
    mapfile -t COMP_WORDS < <(sed 's/\([^\\]\) /\1\n/g' <<<"$line")
    COMP_CWORD=$((${#COMP_WORDS[@]} - 1))
    _fileindexctl
    printf '%s\n' "${COMPREPLY[@]}"
}

in_fish() {
    typed="fileindexctl $1" fish --no-config -c 'fileindexctl completion fish | source; complete -C "$typed"' 2>&1 | cut -f 1
}

# With stand-ins for what works on the line that is being edited only.
in_zsh() {
    typed="fileindexctl $1" zsh -fc '
        compdef() { : }
        compset() { IPREFIX=${(M)PREFIX##${~@[-1]}} PREFIX=${PREFIX##${~@[-1]}} }
        compadd() { offered+=(${(P)@[-1]}) }
        _describe() { offered+=(${${(P)2}%%:*}) }
        _files() { offered+=(*(N) ${PREFIX}*(N)) }
        source =(fileindexctl completion zsh)
        typeset -U offered=() words=("${(@s: :)typed}")
        CURRENT=$#words PREFIX=$words[-1]
        _fileindexctl
        print -l -- $IPREFIX${(M)^offered:#${(b)PREFIX}*}' 2>&1
}

check_rows() {
    local shell=$1 row
    for row in "${@:2}"; do
        expect "$shell: fileindexctl ${row%%|*}" "$(tr , '\n' <<<"${row#*|}")" "$("in_$shell" "${row%%|*}" | LC_ALL=C sort)"
    done
    expect "$shell: one more kind" document,video "$("in_$shell" 'set /photo --media document,v')"
    expect "$shell: no kind twice" document,audio "$("in_$shell" 'set /photo --media document,a')"
}

check_rows bash "${rows[@]}" "${onlyBash[@]}"
if command -v fish >/dev/null; then
    check_rows fish "${rows[@]}" "${notBash[@]}"
fi
if command -v zsh >/dev/null; then
    check_rows zsh "${rows[@]}" "${notBash[@]}"
    expect "what zsh registers" _fileindexctl "$(zsh -fc 'autoload -Uz compinit && compinit -u -d /tmp/dump
        source =(fileindexctl completion zsh) && print $_comps[fileindexctl]' 2>&1)"
fi
[[ ! -e /tmp/hacked ]] || expect "names of folders" "completed" "run"

for shell in '' tcsh; do
    fileindexctl completion $shell &>/dev/null
    expect "status for the shell \"$shell\"" 64 $?
done
expect "the page in JSON" '{"data":{"page":".Dd ' "$(fileindexctl manual --json | cut -c 1-21)"
expect "what mandoc finds" "" "$(fileindexctl manual | mandoc -T lint -W warning 2>&1)"

exit "$((failures > 0))"
