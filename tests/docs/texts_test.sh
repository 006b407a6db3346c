#!/bin/bash
# The examples in the manual pages and in README are what they say they are: files that the library reads, programs
# that compile and run.
set -euo pipefail

# The blocks of literal text among a page's examples; "N" chooses the Nth.
page_example() {
    sed -n '/^\.Sh EXAMPLES/,/^\.Sh SEE/p' "$SOURCE_DIR/man/$1" |
        awk -v wanted="$2" '/^\.Bd/ { ++block; inside = 1; next } /^\.Ed/ { inside = 0 } inside && block == wanted' |
        sed 's/\\-/-/g'
}

readme_example() {
    sed -n "/^\`\`\`$1\$/,/^\`\`\`\$/p" "$SOURCE_DIR/README.md" | sed '/^```/d'
}

failed=0
expect() {
    local what=$1 wanted=$2 got=$3
    [[ $got == *"$wanted"* ]] || { printf '%s: "%s" is missing in\n%s\n' "$what" "$wanted" "$got"; failed=1; }
}

conf=/usr/vork/etc/fileindex
queue=/vol1/photo/@eaDir/VORK@file_index_queue
mkdir -p /vol1/photo/2015 /vol1/documents "${queue%/*}"
echo '{"shares": {"photo": {"path": "/vol1/photo"}, "documents": {"path": "/vol1/documents"}}}' >/usr/vork/etc/platform.conf

page_example fileindex-folder.conf.5 1 >$conf/folder.conf
list=$("$BIN_DIR/fileindexctl" list)
expect folder.conf "/documents   Documents  document,audio,video,photo" "$list"
expect folder.conf "/photo/2015  Holiday    video,photo" "$list"

page_example fileindex-status.conf.5 1 >$conf/status.conf
status=$(TZ=UTC "$BIN_DIR/fileindexctl" status 2>&1) || true
expect status.conf "2026-12-01 07:05" "$status"
expect status.conf photo "$(grep -i space <<<"$status")"

# The page breaks the first line in two.
page_example fileindex-queue.5 1 | sed 'N; s/\n  //; P; D' >$queue
expect queue '"events":{"131072":1,"65536":1},"malformed":0' "$("$BIN_DIR/fileindexctl" queue count --json photo)"

# A queue is taken once: not while it is held or has a second name, and not over one that was taken before.
page_example fileindex-daemon.7 1 >/tmp/take.c
"$CC" -Wall -Wextra -Werror -o /tmp/take /tmp/take.c
expect "a held queue" nothing "$(flock $queue /tmp/take "${queue%/*}")"
ln $queue /vol1/photo/second
expect "a queue of two names" nothing "$(/tmp/take "${queue%/*}")"
rm /vol1/photo/second
expect "the queue" "$(<$queue)" "$(/tmp/take "${queue%/*}")"
expect "the taken queue" '"event":65536' "$(<$queue.tmp)"
echo >$queue
expect "a queue after a taken one" nothing "$(/tmp/take "${queue%/*}")"

compile_and_run() {
    local what=$1 compiler=$2 standard=$3 source=$4
    local include
    read -ra include < <(pkg-config --cflags jsoncpp)
    "$compiler" "-std=$standard" -Wall -Wextra -Werror ${SANITIZE:+"-fsanitize=$SANITIZE"} "-I$SOURCE_DIR/include" \
        "${include[@]}" -o /tmp/program "$source" "-L$LIB_DIR" -lfileindex "-Wl,-rpath,$LIB_DIR" || { failed=1; return; }
    expect "$what" "says: indexed" "says: $(/tmp/program)"
}

page_example libfileindex.3 1 >/tmp/page.cpp
page_example libfileindex.3 2 >/tmp/page.c
readme_example cpp >/tmp/readme.cpp
readme_example c >/tmp/readme.c
for text in page readme; do
    compile_and_run "$text, C++" "$CXX" c++11 /tmp/$text.cpp
    compile_and_run "$text, C" "$CC" c99 /tmp/$text.c
done
exit "$failed"
