# shellcheck shell=bash
# shellcheck disable=SC2154  # ctl and frames are set by demo.sh
# Telling and checking. Sourced by demo.sh.

failures=0
checks=0
if [[ -t 1 && -z ${NO_COLOR-} ]]; then
    bold=$'\e[1m' green=$'\e[32m' red=$'\e[31m' plain=$'\e[0m'
else
    bold='' green='' red='' plain=''
fi

heading() {
    printf '\n%s== %s%s\n' "$bold" "$1" "$plain"
}

note() {
    printf '\n   %s\n' "$1"
}

indent() {
    sed 's/^/      /'
}

show() {
    note "$1 ($2)"
    indent <"$2" || true
}

verdict() {
    checks=$((checks + 1))
    if [[ $1 -eq 0 ]]; then
        printf '   %sok%s      %s\n' "$green" "$plain" "$2"
    else
        failures=$((failures + 1))
        printf '   %sFAILED%s  %s\n' "$red" "$plain" "$2"
    fi
}

# check WHAT COMMAND...: the command succeeds.
check() {
    "${@:2}" >/dev/null 2>&1
    verdict $? "$1"
}

without_blanks() {
    tr -d ' \n\t'
}

# check_json WHAT FILE PART: the file holds the piece of JSON, however it is laid out.
check_json() {
    local file part
    file=$(without_blanks <"$2")
    part=$(without_blanks <<<"$3")
    [[ -n $file && $file == *"$part"* ]]
    verdict $? "$1"
}

check_lines() {
    [[ $(wc -l <"$3") -eq $2 ]]
    verdict $? "$1"
}

# The library waits for no answer, so the last frame may still be on its way to the record.
expect_frames() {
    local tries
    for ((tries = 0; tries < 100; ++tries)); do
        [[ $(wc -l <"$frames") -lt $1 ]] || break
        sleep 0.05
    done
    note "the daemon's last frame (length, text)"
    tail -n 1 "$frames" | indent
    check_lines "frames so far: $1" "$1" "$frames"
}

# The text of the last frame, exactly.
check_frame() {
    local text
    text=$(tail -n 1 "$frames")
    [[ ${text#* } == "$2" ]]
    verdict $? "$1"
}

lengths_are_right() {
    local length text
    while read -r length text; do
        [[ $length -eq $((${#text} + 1)) ]] || return 1
    done <"$1"
}

# Runs fileindexctl, whose exit status shall be the first argument.
ctl_ends_with() {
    local expected=$1 status argument line=fileindexctl
    shift
    for argument in "$@"; do
        [[ $argument != *' '* ]] || argument="\"$argument\""
        line+=" $argument"
    done
    printf '\n   %s$ %s%s\n' "$bold" "$line" "$plain"
    "$ctl" "$@" 2>&1 | indent
    status=${PIPESTATUS[0]}
    [[ $status -eq $expected ]]
    verdict $? "exit status $status"
}

run_ctl() {
    ctl_ends_with 0 "$@"
}

refuse_ctl() {
    ctl_ends_with "$@"
}

conclude() {
    heading "Result"
    if [[ $failures -gt 0 ]]; then
        printf '   %s of %s checks failed.\n' "$failures" "$checks"
        exit 1
    fi
    printf '   All %s checks hold.\n' "$checks"
}
