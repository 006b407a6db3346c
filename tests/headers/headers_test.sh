#!/bin/bash
# Every public header compiles alone, and twice over, under each language standard it promises.
set -euo pipefail

include=$SOURCE_DIR/include
read -ra jsoncpp < <(pkg-config --cflags jsoncpp)
warnings=(-Wall -Wextra -Wpedantic -Wshadow -Werror)

# Prints which header fails under which standard.
check() {
    local language=$1 standard=$2 header=$3 compiler=$CXX
    [[ $language == c++ ]] || compiler=$CC
    if ! printf '#include <%s>\n#include <%s>\n' "$header" "$header" |
        "$compiler" -x "$language" -std="$standard" -fsyntax-only "${warnings[@]}" -I "$include" "${@:4}" -; then
        echo "$header does not compile as $standard"
        return 1
    fi
}

failures=0
headers=0
for header in "$include"/fileindex/*.h; do
    header=fileindex/${header##*/}
    headers=$((headers + 1))
    for standard in c++11 c++14 c++17 c++20; do
        check c++ "$standard" "$header" "${jsoncpp[@]}" || failures=$((failures + 1))
    done
done
# The header of the C functions needs nothing but itself.
check c c99 fileindex/fileidx.h || failures=$((failures + 1))

echo "$headers headers, $failures failures"
[[ $headers -gt 10 && $failures -eq 0 ]]
