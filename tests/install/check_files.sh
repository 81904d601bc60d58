#!/bin/sh
# check_files.sh PREFIX EXPECTED: fails unless exactly the files listed in EXPECTED are in PREFIX.
set -eu
find "$1" ! -type d -printf '%P\n' | LC_ALL=C sort | diff -u "$2" -
