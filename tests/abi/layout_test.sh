#!/bin/bash
# Values, sizes, offsets and virtual slots that compiled callers have built in; see layout.cpp.
set -euo pipefail

if [[ -n $SANITIZE ]]; then
    echo "Says nothing new with instrumentation"
    exit 0
fi

read -ra jsoncpp < <(pkg-config --cflags --libs jsoncpp)
"$CXX" -std=c++11 -Wall -Wextra -I "$SOURCE_DIR/include" "$SOURCE_DIR/tests/abi/layout.cpp" -o /tmp/layout \
    -L "$LIB_DIR" -lfileindex "${jsoncpp[@]}" "-Wl,-rpath,$LIB_DIR" "-Wl,-rpath-link,$LIB_DIR"
/tmp/layout
