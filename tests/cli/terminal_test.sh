#!/bin/bash
# What only a terminal gets: questions, colour, shortened paths.
set -uo pipefail

export PATH="$BIN_DIR:$PATH" TERM=xterm
unset NO_COLOR
failures=0

# Runs a shell command on a terminal of 40 columns, with the given keys typed.
on_terminal() {
    local keys=$1 command=$2
    printf '%s' "$keys" | script --quiet --return --command "stty cols 40; $command" /dev/null | tr -d '\r'
}

expect() {
    local what=$1 expected=$2 found=$3
    [[ $found == "$expected" ]] && return
    printf '%s: "%s" instead of "%s"\n' "$what" "$found" "$expected"
    failures=$((failures + 1))
}

folder=/photo/a-folder-with-a-name/that-goes-on/and-on
mkdir -p /vol1/photo
echo '{"shares": {"photo": {"path": "/vol1/photo"}}}' >/usr/vork/etc/platform.conf
printf '#!/bin/sh\nexit 0\n' >/etc/init.d/fileindexd
chmod +x /etc/init.d/fileindexd
fileindexctl add "$folder" --force --name caffè --media photo &>/dev/null

expect "a table on a terminal" \
    $'PATH                        NAME   MEDIA\n...ame/that-goes-on/and-on  caffè  photo' \
    "$(on_terminal '' 'fileindexctl list')"
fileindexctl add /photo/b --force --name 漢字漢字漢字漢字漢字 &>/dev/null
expect "what is longest is cut" $'PATH          NAME          MEDIA\n...on/and-on  caffè         photo
/photo/b      漢字漢字...   document,...' "$(on_terminal '' 'fileindexctl list')"
fileindexctl remove /photo/b --yes &>/dev/null
expect "a table in a pipe" 1 "$(on_terminal '' 'fileindexctl list | cat' | grep -c "^$folder  caffè  photo$")"

escape=$'\033'
expect "a failed step is red" 1 "$(on_terminal '' 'fileindexctl pause' | grep -c "^$escape\[31mdaemon told  FAILED")"
expect "NO_COLOR" 0 "$(NO_COLOR=1 on_terminal '' 'fileindexctl pause' | grep -c "$escape")"
expect "an empty NO_COLOR" 1 "$(NO_COLOR='' on_terminal '' 'fileindexctl pause' | grep -c "$escape\[31m")"
expect "a terminal that does nothing" 0 "$(TERM=dumb on_terminal '' 'fileindexctl pause' | grep -c "$escape")"
expect "no terminal named" 0 "$(on_terminal '' 'env -u TERM fileindexctl pause' | grep -c "$escape")"
expect "no colour in a pipe" 0 "$(on_terminal '' 'fileindexctl pause | cat' | grep -c "$escape")"

for answer in $'\n' $'n\n' $'no\n' $'maybe\n' $'\004'; do
    on_terminal "$answer" "fileindexctl remove $folder" >/tmp/refused
    expect "status of the answer \"$answer\"" 1 $?
    expect "the question" 1 "$(grep -c "^fileindexctl: this removes $folder .*Go on" /tmp/refused)"
done
expect "the line behind no answer" 1 "$(grep -c "^fileindexctl: nothing was changed" /tmp/refused)"
expect "a path on a terminal" '/photo/\x1b[31m' "$(on_terminal '' "fileindexctl add '/photo/${escape}[31m' --force >/dev/null 2>&1; fileindexctl list --paths" | grep 31m)"
expect "after the refusals" 1 "$(fileindexctl list | grep -c "$folder")"
on_terminal $'y\n' "fileindexctl remove $folder" >/dev/null
expect "after the consent" 0 "$(fileindexctl list 2>/dev/null | grep -c "$folder")"

# Ctrl-C is typed once the second look has been drawn over the first. It reaches the whole terminal: some shells would
# end of it too, so none stays between.
: >/tmp/watched
{
    until grep -q "$escape\[[0-9]*A" /tmp/watched; do sleep 0.05; done
    printf '\003'
} | script --quiet --flush --return --command "exec fileindexctl status --watch --interval 1" /tmp/watched >/dev/null
expect "the status of a watch that is ended" 0 $?
expect "looks drawn" 2 "$(grep -c '^state' <(tr '\r' '\n' </tmp/watched | sed "s/.*$escape\[[0-9?;]*[A-Za-z]state/state/"))"
expect "the terminal as it was" 1 "$(tr -d '\r' </tmp/watched | grep -c "$escape\[?7h$escape\[?25h$")"

status=/usr/vork/etc/fileindex/status.conf
echo '{"no_space": 1}' >$status
on_terminal $'n\n' "fileindexctl doctor --fix" >/dev/null
expect "a repair that is refused" '{"no_space": 1}' "$(cat $status)"
on_terminal $'y\n' "fileindexctl doctor --fix" >/dev/null
expect "a repair, and the copy" $'{}\n{"no_space": 1}' "$(sed 's/ *$//' $status $status.*)"

exit "$((failures > 0))"
