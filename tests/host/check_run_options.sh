#!/bin/sh
# check_run_options.sh PROGRAM RUN: the script RUN must know every option of PROGRAM that takes a
# value, or it would take the value for a file.
set -eu
program=$1
run=$2

fails=0
for option in $("$program" --help | sed -n 's/^ *\(--*[a-z][a-z-]*\) [A-Z[].*/\1/p'); do
    [ "$option" = --source ] || grep -q -e "[ (]$option [|)]\|[ (]$option)" "$run" || {
        echo "$run does not know that $option takes a value" >&2
        fails=1
    }
done
exit $fails
