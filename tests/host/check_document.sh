#!/bin/sh
# check_document.sh PROGRAM DOCUMENT: the first cells of the tables under "Options" and "Commands" of
# the document name exactly the options and commands that the program has, with their arguments. The
# command of settings is one of other programs.
set -eu
named=$(mktemp)
trap 'rm -f "$named"' EXIT
awk '
    /^## / { wanted = $2 == "Options" || $2 == "Commands" }
    wanted && /^\| `/ {
        cell = $0
        sub(/^\| /, "", cell)
        sub(/` \| .*/, "`", cell)
        count = split(cell, names, /`, `/)
        for (i = 1; i <= count; ++i) {
            gsub(/`/, "", names[i])
            gsub(/\\\|/, "|", names[i])
            if (names[i] !~ /^settings /) print names[i]
        }
    }' "$2" | LC_ALL=C sort >"$named"
"$1" --manual usage | LC_ALL=C sort | diff -u - "$named"
