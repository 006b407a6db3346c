#!/bin/bash
# Runs the commands of each transcript and compares everything that they write and return.
#
#   $ COMMAND     is run by the shell; below it stands what it writes to stdout, then, each line after "! ", what it
#                 writes to stderr, then its exit status unless that is 0: "[66]"
#   # TEXT        a remark, after an empty line
#   ? COMMAND     the transcript is left out where this fails
#
# Points in time are shown as TIME or, in names of files, STAMP, seconds since the epoch as EPOCH, numbers of processes
# as PID, lines of the platform's source as PLACE. Each transcript starts on a fresh machine with the shares photo and
# music on /vol1, video on /vol2, and "odd", whose directory has another name. After a deliberate change of an output,
# write the transcripts anew with
#   BIN_DIR=... BUILD_DIR=... REWRITE=1 scripts/in-private-namespace tests/cli/transcripts_test.sh
set -uo pipefail

here=$(dirname "$(realpath "$0")")
export PATH="$BIN_DIR:$PATH" TZ=UTC LC_ALL=C
unset NO_COLOR

fresh_machine() {
    # Not by the init script, which the transcript may have replaced.
    [[ ! -S /run/fileindexd.sock ]] || kill "$(cat /run/peer.pid)"
    rm -f /run/fileindexd.sock
    umount -n /vol2/video 2>/dev/null
    rm -rf /vol1/* /vol2/* /usr/vork/etc/* /tmp/fileidx_cfg_*.lock /tmp/commands
    mkdir -p /usr/vork/etc/fileindex /vol1/photo/2015/trip /vol1/music /vol2/video
    cat >/usr/vork/etc/platform.conf <<'END'
{"shares": {"photo": {"path": "/vol1/photo"}, "music": {"path": "/vol1/music"},
            "video": {"path": "/vol2/video"}, "odd": {"path": "/vol1/even"}}, "search": false}
END
    cat >/etc/init.d/fileindexd <<END
#!/bin/sh
case \$1 in
start) [ -S /run/fileindexd.sock ] || "$BUILD_DIR/demo/fileindex_demo_peer" /tmp/commands /run/peer.pid ;;
stop) [ ! -S /run/fileindexd.sock ] || kill "\$(cat /run/peer.pid)"; rm -f /run/fileindexd.sock ;;
esac
END
    printf '#!/bin/sh\nexit 0\n' >/etc/init.d/smbd
    chmod 755 /etc/init.d/fileindexd /etc/init.d/smbd
}

without_accidents() {
    sed -E 's/[0-9]{4}-[0-9]{2}-[0-9]{2} [0-9]{2}:[0-9]{2} UTC/TIME/g; s/[-0-9]{10}T[0-9:]{8}\+0000/TIME/g
            s/(err=\[0x[0-9A-F]{4}) [a-z_]+\.cpp:[0-9]+\]/\1 PLACE]/
            s/"(oldest|resume_time|time)":[0-9]{10}/"\1":EPOCH/g
            s/(process )[0-9]+ /\1PID /g; s/[0-9]{8}-[0-9]{6}/STAMP/g'
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

# The commands of a transcript share one shell, so that one can build on another. Fails when it is to be left out.
play() {
    local line status first=yes
    while IFS= read -r line; do
        case $line in
        '$ '*)
            printf '%s\n' "$line"
            eval "${line#\$ }" >/tmp/stdout 2>/tmp/stderr </dev/null
            status=$?
            without_accidents </tmp/stdout
            without_accidents </tmp/stderr | sed 's/^/! /'
            [[ $status -eq 0 ]] || printf '[%s]\n' "$status"
            ;;
        '? '*)
            printf '%s\n' "$line"
            eval "${line#\? }" >/dev/null 2>&1 </dev/null || return 1
            ;;
        '#'*)
            [[ $first == yes ]] || echo
            printf '%s\n' "$line"
            ;;
        *) continue ;;
        esac
        first=no
    done <"$1"
    return 0
}

failures=0
for transcript in "$here"/transcripts/*.txt; do
    fresh_machine
    play "$transcript" >/tmp/played || continue
    if [[ -n ${REWRITE-} ]]; then
        cat /tmp/played >"$transcript"
    else
        diff -u --label "expected ${transcript##*/}" --label played "$transcript" /tmp/played || failures=1
    fi
done
exit "$failures"
