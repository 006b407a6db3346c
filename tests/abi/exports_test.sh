#!/bin/bash
# The library exports its interface and nothing else, under its versioned name. After a deliberate change of the
# interface, write the list anew with
#   scripts/list-exports build/dev/lib/libfileindex.so.6.0 >tests/abi/exports.txt
set -euo pipefail

if [[ -n $SANITIZE ]]; then
    echo "SKIPPED: instrumented libraries export more"
    exit 77
fi

library=$LIB_DIR/libfileindex.so.6.0
soname=$(readelf --dynamic --wide "$library" | sed -n 's/.*(SONAME).*\[\(.*\)\]/\1/p')
if [[ $soname != libfileindex.so.6.0 ]]; then
    echo "The library calls itself \"$soname\""
    exit 1
fi
if [[ $(readlink "$LIB_DIR/libfileindex.so") != libfileindex.so.6.0 ]]; then
    echo "The development link does not lead to the library"
    exit 1
fi
"$SOURCE_DIR/scripts/list-exports" "$library" >/tmp/exports.txt
diff -u --label expected --label exported "$SOURCE_DIR/tests/abi/exports.txt" /tmp/exports.txt
