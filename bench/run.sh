#!/bin/sh
# run.sh BUILD_FOLDER: all benchmarks on every tier that the processor runs, one table per tier, kept in
# BUILD_FOLDER/bench-results.
#
# Environment:
#   BENCH_FILTER           regular expression of the Level-1 cases (default: all)
#   BENCH_MIN_TIME         seconds per case (default 0.02)
#   PEER                   path of another BLAS shared library to compare with
#   PEER_SETTING_<tier>    NAME=VALUE, the peer's own setting that holds it to the tier's instruction set
set -eu
build=$1
results=$build/bench-results
cases=${BENCH_FILTER:-.}
long_cases='^([sdcz](axpy|copy|swap)|[sd](dot|rot)|cdotc)/[0-9]{4,}/1/'
mkdir -p "$results"

# The tiers in the order of their numbers, each with the processor's name for its instruction set.
number=0
for tier in def:sse2 sse3:pni ssse3:ssse3 sse42:sse4_2 avx:avx; do
  name=${tier%%:*}
  if ! grep -qwm1 "${tier##*:}" /proc/cpuinfo; then
    echo "tier $name: not on this processor"
    number=$((number + 1))
    continue
  fi
  export QTB_DEBUG_CPU_TYPE=$number
  echo "== tier $name: a slot"
  "$build/bench/slot_cost" | tee "$results/slot-$name.txt"
  echo "== tier $name: Level 1, one thread"
  QTB_NUM_THREADS=1 "$build/bench/level1_bench" --benchmark_filter="$cases" \
    --benchmark_min_time="${BENCH_MIN_TIME:-0.02}" --benchmark_counters_tabular=true | tee "$results/level1-$name.txt"
  echo "== tier $name: Level 1, the routines with a parallel path, all threads"
  "$build/bench/level1_bench" \
    --benchmark_filter="${BENCH_FILTER:-$long_cases}" \
    --benchmark_min_time="${BENCH_MIN_TIME:-0.02}" --benchmark_counters_tabular=true |
    tee "$results/level1-threads-$name.txt"
  if [ -n "${PEER:-}" ]; then
    eval "setting=\${PEER_SETTING_$name:-}"
    echo "== tier $name: beside $PEER ${setting:+with $setting}"
    "$build/bench/compare" --library "$build/libqtb.so" --tier "$number" --peer "$PEER" \
      ${setting:+--peer-setting "$setting"} --threads 1 --sizes "${COMPARE_SIZES:-8,100,4000,32000}" \
      --csv "$results/compare-$name.csv" | tee "$results/compare-$name.txt"
  fi
  number=$((number + 1))
done
