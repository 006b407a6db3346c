#!/bin/bash
# The constants in src/records.h are the table of docs/formats.md, and no fixed line is written anywhere else.
set -euo pipefail
cd "$SOURCE_DIR"

constants=$(sed -nE 's/^inline constexpr char (k\w+Module)\[\] = "(.*)";/s,\1,\2,/p' src/records.h |
    sed -f - src/records.h | sed -nE 's/^inline constexpr Record k\w+ = \{(.*), ([0-9]+)\};/\1 \2/p')
table=$(awk '/^### .*\.cpp$/ { module = $2 } /^## / { module = "" } module && /^\| [0-9]+ \|/ { print module, $2 }' \
    docs/formats.md)
[[ $(wc -l <<<"$table") -gt 50 ]]
diff <(sort <<<"$constants") <(sort <<<"$table")
if grep -rnE '(Module|\.cpp"|LOG_ERR.*),\s*[0-9]{2,}' src tools --include='*.cpp' --include='*.h' | grep -v '^src/records.h:'; then
    exit 1
fi
