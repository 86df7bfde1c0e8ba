#!/bin/sh
# run.sh BUILD_FOLDER: the benchmarks on every tier that the processor runs. Tables, rows for other programs (CSV),
# charts and the summary (summary.md) are kept in BUILD_FOLDER/bench-results.
#
# Environment:
#   BENCH_PARTS            what to run (default: slot level1 kernels gemm families threads balance)
#                            slot     what a dispatch slot costs
#                            level1   Level 1 on one thread and on all, and beside the peer
#                            kernels  the inner kernels of matrix products, beside what their instructions allow
#                            gemm     matrix products on one thread, beside the peer
#                            families the same by the kernels that this processor does not take
#                            threads  matrix products on all threads, beside one thread and beside the peer
#                            balance  how evenly matrix products are cut over up to 64 threads (nothing is timed)
#   BENCH_TIERS            on which tiers (default: def sse3 ssse3 sse42 avx)
#   BENCH_LONG             with any value, square products of sizes 2000 and 4000 too
#   BENCH_FILTER           regular expression of the Level-1 cases (default: all)
#   BENCH_MIN_TIME         seconds per Level-1 case (default 0.005)
#   PEER                   path of another BLAS shared library to compare with
#   PEER_SETTING_<tier>    NAME=VALUE, the peer's own setting that holds it to the tier's instruction set
set -eu
build=$1
results=$build/bench-results
all_tiers='def sse3 ssse3 sse42 avx' # in the order of their numbers
parts=${BENCH_PARTS:-slot level1 kernels gemm families threads balance}
tiers=${BENCH_TIERS:-$all_tiers}
threads=$(nproc)
products=sgemm,dgemm,cgemm,zgemm
mkdir -p "$results"

# The processor's name for the instruction set of a tier.
instruction_set() {
  case $1 in
    def) echo sse2 ;;
    sse3) echo pni ;;
    ssse3) echo ssse3 ;;
    sse42) echo sse4_2 ;;
    avx) echo avx ;;
    *)
      echo "run.sh: no such tier: $1" >&2
      exit 2
      ;;
  esac
}

heading() { echo "== tier $tier: $1"; }

library=$build/libqtb.so

# compared NAME ARGUMENT...: this library beside what the arguments say, as NAME-<tier>.txt and .csv. A wrong result
# shows in the file and fails the run at its end.
compared() {
  name=$1-$tier
  shift
  "$build/bench/compare" --library "$library" "$@" --csv "$results/$name.csv" | tee "$results/$name.txt"
}

# The same beside the peer, where there is one.
beside_peer() {
  name_of_part=$1
  shift
  if [ -n "${PEER:-}" ]; then
    eval "setting=\${PEER_SETTING_$tier:-}"
    set -- "$@" --peer "$PEER" ${setting:+--peer-setting "$setting"}
  fi
  compared "$name_of_part" "$@"
}

part_slot() {
  heading 'a slot'
  "$build/bench/slot_cost" | tee "$results/slot-$tier.txt"
}

level1() { # name filter
  "$build/bench/level1_bench" --benchmark_filter="${BENCH_FILTER:-$2}" \
    --benchmark_min_time="${BENCH_MIN_TIME:-0.005}" --benchmark_counters_tabular=true | tee "$results/$1-$tier.txt"
}

part_level1() {
  heading 'Level 1, one thread'
  QTB_NUM_THREADS=1 level1 level1 .
  heading 'Level 1, the routines with a parallel path, all threads'
  level1 level1-threads '^([sdcz](axpy|copy|swap)|[sd](dot|rot)|cdotc)/[0-9]{4,}/1/'
  [ -n "${PEER:-}" ] || return 0
  heading "Level 1, one thread, beside $PEER"
  beside_peer vectors --threads 1 --sizes 8,32,100,4000,32000
}

part_kernels() {
  heading 'the inner kernels of products alone'
  "$build/bench/inner_kernels" | tee "$results/kernels-$tier.txt"
}

square_sizes=4,8,16,32,64,100,200,350,500,1000${BENCH_LONG:+,2000,4000}

part_gemm() {
  heading "products, one thread${PEER:+, beside $PEER}"
  beside_peer square --threads 1 --routines $products --sizes "$square_sizes"
  beside_peer flat --threads 1 --routines $products \
    --shapes 1000x1000x32,200x200x32,16x1000x1000,16x200x200,1000x16x1000,200x16x200
  beside_peer options --threads 1 --routines $products --options NT,TN,TT --sizes 8,32,200,1000
}

part_families() {
  case $tier in
    def) processor=family16 routines=dgemm ;;
    ssse3) processor=no_sse41 routines=$products ;;
    *) return 0 ;;
  esac
  library=$build/bench/libqtb_other_processor.so
  heading "products, one thread, processor $processor${PEER:+, beside $PEER}"
  beside_peer families --threads 1 --routines "$routines" --sizes "$square_sizes" \
    --setting QTB_BENCH_PROCESSOR=$processor
  library=$build/libqtb.so
}

part_threads() {
  sizes=17,24,32,40,48,56,64,80,96,112,128,160,200,240,280,320,360,400,600,1000,1500
  heading "products, $threads threads, beside one"
  compared threads-serial --threads "$threads" --routines $products --sizes $sizes \
    --peer self --peer-setting QTB_NUM_THREADS=1
  [ -n "${PEER:-}" ] || return 0
  heading "products, $threads threads, beside $PEER"
  beside_peer threads-peer --threads "$threads" --routines $products --sizes $sizes
}

part_balance() {
  heading 'products, the share of an even cut over that of the busiest thread'
  "$build/bench/load_balance" | tee "$results/balance-$tier.txt"
}

number=0
for tier in $all_tiers; do
  case " $tiers " in
    *" $tier "*)
      if grep -qwm1 "$(instruction_set "$tier")" /proc/cpuinfo; then
        export QTB_DEBUG_CPU_TYPE=$number
        for part in $parts; do "part_$part"; done
      else
        echo "tier $tier: not on this processor"
      fi
      ;;
  esac
  number=$((number + 1))
done

folder=$(dirname "$0")
if ls "$results"/*.csv > /dev/null 2>&1; then
  "$folder/summary.sh" "$results" > "$results/summary.md"
  echo "== summary: $results/summary.md"
fi
if ls "$results"/square-*.csv > /dev/null 2>&1; then
  "$folder/chart.sh" "$results"
  echo "== charts: $results/*.svg and *.png"
fi
if grep -E ',(wrong|crashed)(,|$)' "$results"/*.csv 2> /dev/null; then
  echo 'run.sh: wrong results, above' >&2
  exit 1
fi
