#!/bin/sh
# check_run_cases.sh: fails unless run_cases.sh prints what it promises of a program that has a case
# of each outcome.
set -eu
here=$(dirname -- "$(readlink -f -- "$0")")
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT

cat >"$scratch/program" <<'END'
#!/bin/sh
cat <<'OUTPUT'
[==========] Running 4 tests from 1 test suite.
[----------] 4 tests from Suite
[ RUN      ] Suite.Passes
log line[       OK ] Suite.Passes (0 ms)
[ RUN      ] Suite.Fails
log line
test.cpp:1: Failure
[  FAILED  ] Suite.Fails (0 ms)
[ RUN      ] Suite.IsSkipped
no such machine
[  SKIPPED ] Suite.IsSkipped (0 ms)
[ RUN      ] Suite.Hangs
last words
OUTPUT
sleep 60
END
chmod +x "$scratch/program"

status=0
"$here/run_cases.sh" 1 "$scratch/program" >"$scratch/printed" || status=$?
diff -u - "$scratch/printed" <<'END'
[==========] Running 4 tests from 1 test suite.
[ RUN      ] Suite.Fails
log line
test.cpp:1: Failure
[  FAILED  ] Suite.Fails (0 ms)
[ RUN      ] Suite.IsSkipped
no such machine
[  SKIPPED ] Suite.IsSkipped (0 ms)
[ RUN      ] Suite.Hangs
last words
(it did not end)
Stopped after 1 s.
END
[ "$status" -eq 124 ]
