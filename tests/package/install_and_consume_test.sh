#!/bin/bash
# What is installed works for somebody outside: an install into a prefix that the build never heard of is consumed
# through CMake and through pkg-config, in C99 and in C++11, and the programs run.
set -euo pipefail

if [[ -n $SANITIZE ]]; then
    echo "SKIPPED: consumers of an instrumented library would need the same instrumentation"
    exit 77
fi

# Runs a command whose output only matters when it fails.
quietly() {
    "$@" >"$work/log" 2>&1 || { cat "$work/log"; exit 1; }
}

work=$(mktemp -d)
prefix="$work/any prefix"
quietly "$CMAKE" --install "$BUILD_DIR" --prefix "$prefix"
# The tree as installed, in another place: nothing in it may depend on where it was.
mv "$prefix" "$work/moved"
prefix=$work/moved

libdir=$(dirname "$(find "$prefix" -name libfileindex.so)")
record='{"audio":false,"document":true,"name":"2015","path":"/photo/2015","photo":true,"video":false}'
printf '{"/photo/2015":%s}' "$record" >/usr/vork/etc/fileindex/folder.conf

expect() {
    local output
    output=$("$1")
    [[ $output == "$2" ]] || { echo "$1 printed \"$output\", not \"$2\""; exit 1; }
    echo "$3"
}

quietly "$CMAKE" -G Ninja -S "$SOURCE_DIR/tests/package" -B "$work/cmake" -DCMAKE_PREFIX_PATH="$prefix"
quietly "$CMAKE" --build "$work/cmake"
expect "$work/cmake/consumer_cpp" "consumer in C++: good" "CMake, C++11"
expect "$work/cmake/consumer_c" "consumer in C: good" "CMake, C99"

export PKG_CONFIG_PATH=$libdir/pkgconfig
read -ra flags < <(pkg-config --cflags --libs fileindex)
warnings=(-Wall -Wextra -Wpedantic -Werror)
"$CXX" -std=c++11 "${warnings[@]}" -o "$work/cpp" "$SOURCE_DIR/tests/package/consumer.cpp" "${flags[@]}" \
    -Wl,-rpath,"$libdir"
"$CC" -std=c99 "${warnings[@]}" -o "$work/c" "$SOURCE_DIR/tests/package/consumer.c" "${flags[@]}" \
    -Wl,-rpath,"$libdir"
expect "$work/cpp" "consumer in C++: good" "pkg-config, C++11"
expect "$work/c" "consumer in C: good" "pkg-config, C99"

version=$(pkg-config --modversion fileindex)
[[ $version == 6.0.* ]] || { echo "pkg-config calls the version $version"; exit 1; }
