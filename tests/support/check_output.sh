#!/bin/sh
# check_output.sh EXPECTED COMMAND [ARGUMENT...]: fails unless the command succeeds and prints
# exactly what the file EXPECTED holds.
set -eu
expected=$1
shift
printed=$("$@" && echo .)
printf '%s' "${printed%.}" | diff -u "$expected" -
