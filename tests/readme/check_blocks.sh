#!/bin/sh
# check_blocks.sh DOCUMENT: in a Markdown document, the block of code that follows a comment
# `<!-- from FILE -->` is a copy of FILE, a path relative to the document. Fails when one is not, and
# when there is none.
set -eu
cd "$(dirname -- "$1")"
document=$(basename -- "$1")

files=$(sed -n 's/^<!-- from \(.*\) -->$/\1/p' "$document")
[ -n "$files" ] || { echo "$document marks no blocks" >&2; exit 1; }
for file in $files; do
    awk -v marker="<!-- from $file -->" '
        $0 == marker { wanted = 1; next }
        inside && /^```$/ { exit }
        inside { print }
        wanted && /^```/ { inside = 1 }
    ' "$document" | diff -u "$file" -
done
