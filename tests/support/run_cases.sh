#!/bin/sh
# run_cases.sh SECONDS PROGRAM: runs the test cases of PROGRAM and prints those that failed, in
# full, and the totals. Of a program that dies or takes longer than SECONDS, it prints the case that
# it was at.
set -u
limit=$1 program=$2

output=$(mktemp)
trap 'rm -f "$output"' EXIT
status=0
timeout --kill-after=5 "$limit" "$program" >"$output" 2>&1 || status=$?
awk '
    /^\[ RUN      \]/ { held = $0; next }
    /\[       OK \]/ { held = ""; next }
    /\[  (FAILED |SKIPPED) \]/ && held != "" { print held; held = "" }
    held != "" { held = held "\n" $0; next }
    /^\[-+\]/ || /^$/ { next }
    { print }
    END { if (held != "") print held "\n(it did not end)" }
' "$output"
[ "$status" -ne 124 ] || echo "Stopped after $limit s."
exit "$status"
