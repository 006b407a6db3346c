#!/bin/bash
# Nothing includes what stands below its own room in the tree of docs/architecture.md. Internal headers have their head.
set -euo pipefail
cd "$SOURCE_DIR"

grep -rHE '^#include ("|<(fileindex|vork|vorknotifyd)/)' base include src platform/linux tools | awk -F '[ :]+' '
    function Room(path) {
        while (path != "" && !(path in rank)) sub(/[^\/]+\/?$/, "", path)
        return path == "" ? 0 : rank[path]
    }
    function Included(name, own) {
        if (name ~ /^<fileindex/) return rank[substr(name, 12, length(name) - 12)] + 0
        if (name ~ /^</) return rank["platform/include/"]
        gsub(/"/, "", name)
        if (name ~ /^src\//) return own ~ /^tools/ ? rank[name] + 0 : Room(substr(name, 5))
        return name !~ /^base\// && own ~ /^(platform|tools)/ ? Room(own) : Room(name)
    }
    FILENAME != "-" && /^```/ { drawn = !drawn }
    FILENAME != "-" { for (i = 1; drawn && i <= NF; ++i) if ($i ~ /(\/|\.h|\.cpp)$/) rank[$i] = FNR; next }
    { own = $1; sub(/^(src|include\/fileindex)\//, "", own); includes = Included($3, own); ++count }
    !Room(own) || !includes || includes > Room(own) { print $1 " must not include " $3; failed = 1 }
    END { exit failed || count < 300 }' docs/architecture.md -

headers=$(find base src platform/linux tools -name '*.h')
[[ $(wc -l <<<"$headers") -gt 50 ]]
while read -r header; do
    if [[ $(head -n 1 "$header") != '/// \file' ]] || ! grep -qx '#pragma once' "$header"; then
        echo "$header: its head"
        exit 1
    fi
done <<<"$headers"
