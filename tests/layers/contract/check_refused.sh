#!/bin/sh
# check_refused.sh PROGRAM SOURCE RULE: fails unless PROGRAM, asked for the tests of the wrong SOURCE,
# ends by itself and reports RULE and nothing else as failed.
set -u
program=$1 source=$2 rule=$3
output=$("$program" --gtest_filter="$source/*" 2>&1)
status=$?
failed=$(printf '%s\n' "$output" |
    sed -n 's/^\[  FAILED  \] [^ ]*\/SourceContract\/Rule\.\([A-Za-z]*\), where .* ms)$/\1/p')
[ "$status" -eq 1 ] && [ "$failed" = "$rule" ] && exit 0
printf '%s\nexit status %s, expected to fail: %s\n' "$output" "$status" "$rule"
exit 1
