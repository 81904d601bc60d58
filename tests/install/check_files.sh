#!/bin/sh
# check_files.sh PREFIX LIST...: fails unless exactly the files of the lists are in PREFIX.
set -eu
prefix=$1
shift
found=$(mktemp)
trap 'rm -f "$found"' EXIT
find "$prefix" ! -type d -printf '%P\n' | LC_ALL=C sort >"$found"
LC_ALL=C sort -- "$@" | diff -u - "$found"
