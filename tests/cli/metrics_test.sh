#!/bin/bash
# The metrics as a server reads them: the grammar of the text format, and the conventions for names.
set -euo pipefail

# Prints what is wrong with the page on stdin, which the first pages below are.
check() {
    awk '
    function fault(what) { print "line " NR ": " what ": " $0; bad = 1 }
    BEGIN { label = "[a-z_]+=\"([^\"\\\\]|\\\\[\\\\\"n])*\"" }
    /^# HELP fileindex_[a-z_]+ [A-Z].*\.$/ { if (seen[$3]++) fault("described twice"); help = $3; next }
    /^# TYPE fileindex_[a-z_]+ gauge$/ { if ($3 != help) fault("no HELP before"); type = $3; next }
    $0 ~ ("^[a-z_]+([{]" label "(," label ")*[}])? [0-9]+$") {
        name = $0; sub(/[{ ].*/, "", name)
        if (name != type) fault("not below its TYPE")
        series = $0; sub(/ [0-9]+$/, "", series)
        if (series in value) fault("given twice")
        value[series] = $NF
        if (name ~ /_timestamp/ && name !~ /_timestamp_seconds$/) fault("no base unit")
        next
    }
    { fault("neither a comment nor a sample") }
    END { if (NR == 0) print "nothing"; exit bad }'
}

ctl=$BIN_DIR/fileindexctl
hostile=$'a"b\\c\nd \xe9{},\e\xe2\x80\xae'
mkdir -p "/vol1/$hostile" /vol1/photo
inJson='a\"b\\c\nd '$'\xe9''{},\u001b\u202e'
printf '{"shares": {"photo": {"path": "/vol1/photo"}, "%s": {"path": "/vol1/%s"}}}' "$inJson" "$inJson" \
    >/usr/vork/etc/platform.conf
for fault in 'fileindex_paused 0' '# TYPE fileindex_a gauge' 'x{share="a"b"} 1' ''; do
    ! check <<<"$fault" >/dev/null || { echo "taken for good: $fault"; exit 1; }
done
"$ctl" metrics | check
"$ctl" add /photo &>/dev/null || true
"$ctl" add "/$hostile" &>/dev/null || true
echo x >>"/vol1/$hostile/@eaDir/VORK@file_index_queue"
"$ctl" pause 8 &>/dev/null || true
"$ctl" metrics >/tmp/metrics
check </tmp/metrics

expect() { grep -qxF "$1" /tmp/metrics || { echo "missing: $1"; cat /tmp/metrics; exit 1; }; }
share='share="a\"b\\c\nd \\xe9{},\\x1b\\xe2\\x80\\xae"'
expect "fileindex_folders{$share} 1"
expect "fileindex_queue_malformed_lines{$share} 1"
expect "fileindex_paused 1"
iconv -f UTF-8 -t UTF-8 /tmp/metrics >/tmp/utf8
