#!/bin/sh
# check_symbols.sh NM LIBRARY LIST [--update]: fails unless LIBRARY exports exactly the symbols in
# LIST, demangled, one a line; what is missing or new is shown. With --update LIST is written anew.
set -eu
nm=$1 library=$2 list=$3
exported=$(mktemp)
trap 'rm -f "$exported"' EXIT
# Without addresses and kinds, which are the linker's and the compiler's business, and without the
# version, whose own name is left out.
"$nm" -DC --defined-only "$library" | LC_ALL=C awk '
    $2 == "A" { next }
    { sub(/^[^ ]* . /, ""); sub(/@@VELKOR_[A-Z0-9_]*$/, ""); print }' | LC_ALL=C sort -u >"$exported"
[ -s "$exported" ] || { echo "$library exports nothing at all" >&2; exit 1; }
if [ "${4-}" = --update ]; then
    cp "$exported" "$list"
    exit
fi
diff -u "$list" "$exported"
