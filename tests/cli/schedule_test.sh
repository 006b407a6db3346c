#!/bin/bash
# The times that a pause is given, against those of "date". A reading may fall on the turn of a minute, so it is
# compared with the one before and the one after.
set -uo pipefail

ctl=$BIN_DIR/fileindexctl
export TZ=XYZ-5:30 # of its own, and half an hour off the full one
failures=0

paused_until() { "$ctl" pause "$@" 2>/dev/null | sed -n 's/^indexing is paused until //p'; }

expect() {
    local what=$1 before=$2 found=$3 after=$4
    [[ $found == "$before" || $found == "$after" ]] && return
    echo "$what: \"$found\" instead of \"$before\" or \"$after\""
    failures=$((failures + 1))
}

in_hours() { date -d "$1 hours" '+%Y-%m-%d %H:%M %Z'; }

for hours in 1 8h 100; do
    before=$(in_hours "${hours%h}")
    found=$(paused_until "$hours")
    expect "pause $hours" "$before" "$found" "$(in_hours "${hours%h}")"
done

for length in '30m:30 minutes' '90m:90 minutes' '1h30m:90 minutes' '2d:48 hours' '1d1m:1441 minutes' '120m:2 hours'; do
    before=$(date -d "${length#*:}" '+%Y-%m-%d %H:%M %Z')
    found=$(paused_until "${length%:*}")
    expect "pause ${length%:*}" "$before" "$found" "$(date -d "${length#*:}" '+%Y-%m-%d %H:%M %Z')"
done

# The next time the clock shows it: today if that is still to come, otherwise tomorrow.
next() {
    local today
    today=$(date -d "$1" +%s)
    if ((today > $(date +%s))); then
        date -d "$1" '+%Y-%m-%d %H:%M %Z'
    else
        date -d "tomorrow $1" '+%Y-%m-%d %H:%M %Z'
    fi
}

for time in 00:00 6:30 06:30 23:59 "$(date +%H:%M)" "$(date -d '2 minutes' +%H:%M)"; do
    before=$(next "$time")
    found=$(paused_until --until "$time")
    expect "pause --until $time" "$before" "$found" "$(next "$time")"
done

# To the second, which whole hours from now would miss.
stored=$("$ctl" status --json | sed 's/.*"resume_time":\([0-9]*\).*/\1/')
expect "the seconds of the stored time" 00 "$(date -d "@$stored" +%S)" 00

# The longest pause ends in January 2038.
longest=$(((2147483647 - $(date +%s)) / 3600))
expect "the longest pause" 2038-01-19 "$(paused_until $((longest - 1)) | cut -d' ' -f1)" 2038-01-18
expect "a longer one" "" "$(paused_until $((longest + 1)))" ""

exit "$((failures > 0))"
