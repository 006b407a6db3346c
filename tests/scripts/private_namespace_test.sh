#!/bin/bash
# What scripts/in-private-namespace promises to the tests that run in it. This test runs in it too, so "outside" is
# a private file system as well.
# shellcheck disable=SC2016  # the inner shells expand
set -uo pipefail

run=$SOURCE_DIR/scripts/in-private-namespace
failures=0

expect() {
    local what=$1 expected=$2 found=$3
    [[ $found == "$expected" ]] && return
    echo "$what: \"$found\" instead of \"$expected\""
    failures=$((failures + 1))
}

"$run" bash -c 'exit 7'
expect "exit status" 7 $?
"$run" bash -c 'kill -KILL $$' 2>/dev/null
expect "status after a signal" 137 $?
expect "standard input and output" "through" "$(echo through | "$run" cat)"
expect "arguments" "<a b><*><>" "$("$run" printf '<%s>' 'a b' '*' '')"
expect "ignored or blocked signals" "" \
    "$("$run" grep -E '^Sig(Blk|Ign):' /proc/self/status | grep -v '[[:space:]]0*$')"

for file in /tmp/f /run/f /var/run/g /usr/vork/f /usr/vork/etc/fileindex/f /usr/vork/bin/f /vol1/f /vol2/f /etc/f \
    /etc/init.d/f; do
    "$run" bash -c 'echo inside >"$0" && [[ $(<"$0") == inside ]]' "$file"
    expect "writing $file" 0 $?
    expect "$file outside" "" "$(ls "$file" 2>/dev/null)"
done

mkdir -p /run/systemd/system /usr/vork/etc/secret
expect "what is seen of the outside" "" "$("$run" bash -c 'ls -d /run/systemd /usr/vork/etc/secret' 2>/dev/null)"

# A process left behind ends with the command; were it alive, it would hold the pipe open and the read would not end.
expect "a process left behind" "" "$("$run" bash -c 'sleep 1000 &')"

# Beside and instead of each other: each sees its own file only.
for i in 1 2 3 4 5 6; do
    "$run" bash -c 'echo "$0" >/tmp/f; for i in 1 2 3 4 5; do [[ $(<"/tmp/f") == "$0" ]] || exit 1; done' "$i" &
done
for job in $(jobs -p); do
    wait "$job"
    expect "a run beside others" 0 $?
done

copy="/tmp/a check out/scripts"
mkdir -p "$copy" /tmp/kept/deep /tmp/other
cp "$run" "$copy"
printf '#!/bin/sh\necho "$PWD"; ls -d "/tmp/a check out" /tmp/kept /tmp/other 2>/dev/null\n' >"$copy/here"
chmod +x "$copy/here"
here=$'\n/tmp/a check out'
expect "a checkout below /tmp" "$copy$here" "$(cd "$copy" && ./in-private-namespace ./here)"
expect "--keep" "/$here"$'\n/tmp/kept' "$(cd / && "$run" --keep /tmp/kept/deep -- "$copy/here")"
expect "an empty environment" "$copy$here" "$(cd "$copy" && env -i ./in-private-namespace ./here)"

closed="/tmp/closed/home of somebody"
mkdir -p "$closed/build" "$closed/private"
touch "$closed/build/seen" "$closed/private/hidden"
chmod 700 /tmp/closed "$closed" "$closed/private"
as_nobody=(setpriv --reuid=65534 --clear-groups)
expect "what others see in a closed directory" "build private seen" \
    "$("$run" --keep "$closed/build" "${as_nobody[@]}" ls "$closed" "$closed/build" "$closed/private" 2>/dev/null |
        grep -v : | xargs)"
expect "whether it is closed outside" 700 "$(stat -c %a "$closed")"

exit "$((failures > 0))"
