#!/bin/sh
# run_long.sh BUILD [WRAPPER...]: the races and histories of the configured folder BUILD, for long:
# 16 threads for five minutes, 100000 rounds of each race, and 10000 schedules by chance of each
# scenario beside all of few preemptions. WRAPPER runs the programs (`setarch -R` for those with the
# thread sanitizer, whose address layout is fixed).
set -eu
build=$1
shift
VELKOR_HISTORY_THREADS=16 VELKOR_HISTORY_CALLS=16 VELKOR_HISTORY_SECONDS=150 \
    "$@" "$build/tests/stress/history-tests" --gtest_filter='StoreHistories*' \
    --gtest_output="json:$build/long-histories.json"
grep -E '"(name|rounds)"' "$build/long-histories.json"
export VELKOR_STRESS_ROUNDS=100000
"$@" "$build/tests/stress/stress-tests" --gtest_brief=1
# The cases of futures that race, each round with a thread of its own.
"$@" "$build/tests/framework/future-tests" --gtest_brief=1 \
    --gtest_filter='PromiseRaces.*:*Race.*:FutureGet.ConsumerMayDestroy*:SharedFutureState.ManyThreads*'
# Which the thread sanitizer has none of.
for program in schedule-tests store-schedule-tests; do
    [ ! -x "$build/tests/stress/$program" ] || VELKOR_SCHEDULES=10000 \
        "$@" "$build/tests/stress/$program" --gtest_brief=1 --gtest_filter='-Scheduler*'
done
