#!/bin/sh
# check_output.sh EXPECTED COMMAND [ARGUMENT...]: fails unless the command succeeds and prints
# exactly what the file EXPECTED holds. It runs in the folder of the repository, where the examples
# expect to be; both paths are absolute.
set -eu
cd "$(dirname -- "$0")/../.."
expected=$1
shift
printed=$("$@" && echo .)
printf '%s' "${printed%.}" | diff -u "$expected" -
