#!/bin/sh
# check_page.sh GROFF PROGRAM: the page of the manual that the program makes of itself is one that
# GROFF has nothing to say of.
set -eu
page=$(mktemp)
trap 'rm -f "$page"' EXIT
"$2" --manual man >"$page"
said=$("$1" -man -ww -z -Tutf8 "$page" 2>&1)
[ -z "$said" ] || { printf '%s\n' "$said" >&2; exit 1; }
shown=$("$1" -man -Tascii -P-c -P-b -P-u "$page")
for part in 'velkor-config [OPTIONS] [FILE...] [-- COMMAND...]' '--source' 'put' 'NO_COLOR'; do
    case $shown in
        *"$part"*) ;;
        *) echo "the page lacks: $part" >&2; exit 1 ;;
    esac
done
