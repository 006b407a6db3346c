#!/bin/bash
# Runs the commands of a transcript and compares everything that they write and return.
#
#   play_transcript.sh FILE
#
#   $ COMMAND     is run by the shell. Below it stands what it writes to stdout, then what it writes to stderr: "! " for
#                 the tool's own "fileindexctl: ", "!! " before any other line. An exit status other than 0 ends the last
#                 line: " [66]". A single line stands after the command where both fit into 160 columns: "$ COMMAND  #> LINE".
#                 Lines of a report that end in the same way, one below the other, share a line: "saved  done | monitor  done"
#   # TEXT        a remark, after an empty line
#   ? COMMAND  #> REASON    where the command fails, the transcript cannot be played, for that reason
#
# Points in time are shown as TIME or, in names of files, STAMP, seconds since the epoch as EPOCH, numbers of processes
# as PID, lines of the platform's source as PLACE. Of a long output, a filter at the end of the command leaves what is
# told: "grep", "head"; what the filter leaves is compared, and the status is that of the first to fail in the pipe.
#
# Each transcript starts on a fresh machine with the shares photo and music on /vol1, video on /vol2, and "odd", whose
# directory has another name. After a deliberate change of an output, write them anew with
#   REWRITE=1 ctest --preset dev -R cli.transcripts
set -uo pipefail

transcript=$(realpath "$1")
failed=0
export PATH="$BIN_DIR:$PATH" TZ=UTC LC_ALL=C
unset NO_COLOR

make_machine() {
    mkdir -p /usr/vork/etc/fileindex /vol1/photo/2015/trip /vol1/music /vol2/video
    cat >/usr/vork/etc/platform.conf <<'END_OF_FILE'
{"shares": {"photo": {"path": "/vol1/photo"}, "music": {"path": "/vol1/music"},
            "video": {"path": "/vol2/video"}, "odd": {"path": "/vol1/even"}}, "search": false}
END_OF_FILE
    cat >/etc/init.d/fileindexd <<END_OF_FILE
#!/bin/sh
case \$1 in
start) [ -S /run/fileindexd.sock ] || "$BUILD_DIR/demo/fileindex_demo_peer" /tmp/commands /run/peer.pid ;;
stop) [ ! -S /run/fileindexd.sock ] || kill "\$(cat /run/peer.pid)"; rm -f /run/fileindexd.sock ;;
esac
END_OF_FILE
    printf '#!/bin/sh\nexit 0\n' >/etc/init.d/smbd
    chmod 755 /etc/init.d/fileindexd /etc/init.d/smbd
}

# What the daemon received, once it has read that many commands.
# shellcheck disable=SC2317  # the transcripts call it
received() {
    local _
    for _ in {1..1000}; do
        [[ $(wc -l </tmp/commands) -lt $1 ]] || break
        sleep 0.01
    done
    cat /tmp/commands
}

# What "explain" says of a path, in short.
# shellcheck disable=SC2317  # the transcripts call it
why() {
    local json status
    json=$(fileindexctl explain --json "$1")
    status=$?
    echo "$1: $status $(grep -oE '"(explained|failed_rule|indexable)":[^,]*|"result":"failed"|"remedy":"' <<<"$json" |
        tr -d '"' | paste -sd ' ')"
}

# What the doctor finds, a line for each finding.
# shellcheck disable=SC2317  # the transcripts call it
found() { "${doctor[@]}" "$@" | awk 'BEGIN { RS = "" } NR > 1 { gsub(/\n  /, " | "); print }'; }
doctor=(fileindexctl doctor)

# The answers to several command lines, a line for each: the exit status, and all that is written.
# shellcheck disable=SC2317  # the transcripts call it
each() {
    local words status
    for words in "$@"; do
        eval "${each-fileindexctl} $words" >/tmp/each 2>&1 </dev/null
        status=$?
        echo "$words: [$status] $(sed 's/^fileindexctl: /! /' /tmp/each | paste -sd '|')"
    done
}

# A line for each record of the input, which begins with such a line.
# shellcheck disable=SC2317  # the transcripts call it
records() { awk -v start="$1" '{ printf "%s%s", NR == 1 ? "" : $0 ~ start ? "\n" : " | ", $0 } END { print "" }'; }

# A command of somebody who is not root.
# shellcheck disable=SC2317  # the transcripts call it
stranger() { setpriv --reuid=65534 --clear-groups fileindexctl "$@"; }

without_accidents() {
    sed -E 's/[0-9]{4}-[0-9]{2}-[0-9]{2} [0-9]{2}:[0-9]{2} UTC/TIME/g; s/[-0-9]{10}T[0-9:]{8}\+0000/TIME/g
            s/(err=\[0x[0-9A-F]{4}) [a-z_]+\.cpp:[0-9]+\]/\1 PLACE]/
            s/"(oldest|resume_time|time)":[0-9]{10}/"\1":EPOCH/g
            s/(process )[0-9]+ /\1PID /g; s/[0-9]{8}-[0-9]{6}/STAMP/g'
}

# The answer of a command in the form above.
show() {
    {
        without_accidents </tmp/stdout
        without_accidents </tmp/stderr | sed 's/^fileindexctl: /! /; t; s/^/!! /'
    } | command=$1 status=$2 awk '
        BEGIN { command = ENVIRON["command"]; status = ENVIRON["status"] }
        /  +(done|as before|not reached)$/ && step && length(line[n] $0) < 140 { line[n] = line[n] " | " $0; next }
        { line[++n] = $0; step = /  +(done|as before|not reached)$/ }
        END {
            if (status != 0) line[n] = (n ? line[n] " " : line[++n]) "[" status "]"
            if (n == 1 && length(command line[1]) < 154) { print "$ " command "  #> " line[1]; exit }
            print "$ " command
            for (i = 1; i <= n; ++i) print line[i]
        }'
}

# The commands share one shell, so that one can build on another.
play() {
    local line command first=yes
    while IFS= read -r line; do
        command=${line#??}
        command=${command%%  #> *}
        case $line in
        '$ '*)
            eval "$command" >/tmp/stdout 2>/tmp/stderr </dev/null
            show "$command" $?
            ;;
        '? '*)
            printf '%s\n' "$line"
            eval "$command" >/dev/null 2>&1 </dev/null || { echo "skipped: ${line#*  #> }" >&2 && exit 77; }
            ;;
        '#'*)
            [[ $first == yes ]] || echo
            printf '%s\n' "$line"
            ;;
        *) continue ;;
        esac
        first=no
    done <"$1"
}

grep -q '^\$ ' "$transcript" || { echo "there is no command in $transcript" && exit 1; }
make_machine
play "$transcript" >/tmp/played
if [[ -n ${REWRITE-} ]]; then
    cat /tmp/played >"$transcript"
else
    diff -u --label "expected ${transcript##*/}" --label played "$transcript" /tmp/played || failed=1
fi
exit "$failed"
