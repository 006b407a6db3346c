#!/bin/bash
# What is installed works for somebody outside: an install into a prefix that the build never heard of is consumed.
set -euo pipefail

if [[ -n $SANITIZE ]]; then
    echo "SKIPPED: consumers of an instrumented library would need the same instrumentation"
    exit 77
fi

work=$(mktemp -d)
prefix="$work/any prefix"
"$CMAKE" --install "$BUILD_DIR" --prefix "$prefix" >"$work/log" 2>&1 || { cat "$work/log"; exit 1; }
# The tree as installed, in another place: nothing in it may depend on where it was.
mv "$prefix" "$work/moved"
"$SOURCE_DIR/tests/package/consume" "$work/moved"
