#!/bin/sh
# check_transcripts.sh DOCUMENT PROGRAM_FOLDER: each indented block that follows a comment
# `<!-- run -->` in a Markdown document is what a terminal shows: commands behind "$ ", which go on
# in the next line behind a "\" or a "|", and what they write. Runs them, in a copy of the examples,
# with the programs of that folder, and fails when they write something else, or when no block is
# marked.
set -eu
document=$(readlink -f -- "$1")
programs=$(readlink -f -- "$2")
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
cp -R "$(dirname -- "$0")/../../examples" "$scratch/examples"

awk '
    $0 == "<!-- run -->" { wanted = 1; next }
    wanted && /^    / { print substr($0, 5); inside = 1; next }
    inside && /^$/ { print ""; next }
    inside { wanted = inside = 0 }
' "$document" | sed -e '/^$/d' >"$scratch/shown"
[ -s "$scratch/shown" ] || { echo "$document marks no blocks" >&2; exit 1; }

awk -v quote="'" '
    function quoted(text) { gsub(quote, quote "\\" quote quote, text); return quote text quote }
    /^\$ / || continues {
        print "printf \"%s\\n\" " quoted($0)
        command = continues ? command "\n" $0 : substr($0, 3)
        continues = /[\\|]$/
        if (!continues) print "{ " command "\n} 2>&1 || true"
    }
' "$scratch/shown" >"$scratch/script"

cd "$scratch"
PATH="$programs:$PATH" sh ./script | sed -e '/^$/d' | diff -u shown -
