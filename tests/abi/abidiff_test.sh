#!/bin/bash
# The binary interface is the recorded one: types of parameters and results, layouts, tables of virtual functions.
# After a deliberate change write the record anew with
#   scripts/dump-abi build/dev/lib/libfileindex.so.6.0 >tests/abi/libfileindex.abi
set -euo pipefail

if ! command -v abidiff >/dev/null; then
    echo "SKIPPED: abidiff is not installed (package abigail-tools; ./run deps installs it)"
    exit 77
fi
if [[ -n $SANITIZE ]]; then
    echo "SKIPPED: instrumented libraries describe their types otherwise"
    exit 77
fi

"$SOURCE_DIR/scripts/dump-abi" "$LIB_DIR/libfileindex.so.6.0" >/tmp/current.abi
abidiff "$SOURCE_DIR/tests/abi/libfileindex.abi" /tmp/current.abi
