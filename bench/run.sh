#!/bin/sh
# run.sh BUILD_FOLDER: the benchmarks on every tier that the processor runs. Tables, rows for other programs (CSV),
# charts and the summary (summary.md) are kept in BUILD_FOLDER/bench-results.
#
# Environment:
#   BENCH_PARTS            what to run (default: slot face level1 level2 kernels gemm flat families threads level3
#                            balance)
#                            slot     what a dispatch slot costs
#                            face     what a companion costs a call, and a process, beside the reference BLAS
#                            level1   Level 1 on one thread and on all, and beside the peer
#                            level2   Level 2: every option and increment in cache, odd leading dimensions, some beyond
#                                     the caches, and on all threads
#                            kernels  the inner kernels of matrix products, beside what their instructions allow
#                            gemm     matrix products on one thread, beside the peer
#                            flat     matrix products with one short side, on one thread, beside the peer
#                            families the same by the kernels that this processor does not take
#                            threads  matrix products on all threads, beside one thread and beside the peer
#                            level3   the rest of Level 3 on one thread, beside gemm and the peer, and on all threads
#                            balance  how evenly matrix products are cut over up to 64 threads (nothing is timed)
#   BENCH_TIERS            on which tiers (default: all)
#   BENCH_LONG             with any value, square products of sizes 2000 and 4000 too, and Level 2 with every option at
#                          every size
#   BENCH_QUICK            with any value, Level 2 and Level 3 at few sizes with few options, in about a minute and a
#                          half a tier and in six
#   BENCH_FILTER           regular expression of the Level-1 cases (default: all)
#   BENCH_MIN_TIME         seconds per Level-1 case (default 0.005)
#   PEER                   path of another BLAS shared library to compare with; PEER2 and PEER3 more of them
#   PEER_SETTING_<tier>    NAME=VALUE, the peer's own setting that holds it to the tier's instruction set; likewise
#                          PEER2_SETTING_<tier> and PEER3_SETTING_<tier>
set -eu
build=$1
results=$build/bench-results
parts=${BENCH_PARTS:-slot face level1 level2 kernels gemm flat families threads level3 balance}
threads=$(nproc)
products=sgemm,dgemm,cgemm,zgemm
mkdir -p "$results"

# number name runs|lacks, a line per tier; the summary and the charts read it too.
"$build/bench/tiers" > "$results/tiers.txt"
tiers=${BENCH_TIERS:-$(cut -d ' ' -f 2 "$results/tiers.txt")}
for tier in $tiers; do
  grep -q " $tier " "$results/tiers.txt" || { echo "run.sh: no such tier: $tier" >&2; exit 2; }
done

heading() { echo "== tier $tier: $1"; }

library=$build/libqtb.so

# compared NAME ARGUMENT...: this library beside what the arguments say, as NAME-<tier>.txt and .csv. A wrong result
# shows in the file and fails the run at its end.
compared() {
  name=$1-$tier
  shift
  "$build/bench/compare" --library "$library" "$@" --csv "$results/$name.csv" | tee "$results/$name.txt"
}

# The same beside the peers that there are.
beside_peer() {
  name_of_part=$1
  shift
  for which in PEER PEER2 PEER3; do
    eval "path=\${$which:-} setting=\${${which}_SETTING_$tier:-}"
    [ -z "$path" ] || set -- "$@" --peer "$path" ${setting:+--peer-setting "$setting"}
  done
  compared "$name_of_part" "$@"
}

part_slot() {
  heading 'a slot'
  "$build/bench/slot_cost" | tee "$results/slot-$tier.txt"
}

reference=/usr/lib/x86_64-linux-gnu/blas/libblas.so.3
part_face() {
  [ -x "$build/bench/companion_cost" ] && [ -e $reference ] || return 0
  heading 'a companion'
  "$build/bench/companion_cost" "$library" "$build/interfaces/libblas.so.3" $reference "$build/bench/one_call" |
    tee "$results/face-$tier.txt"
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

# Some letters of each routine of Level 2: plain and transposed, upper and lower.
some_options=N,T,U,UNN,LTN
# The routines with a parallel path.
threaded=gemv,ssymv,dsymv,ssyr,dsyr,ssyr2,dsyr2,trmv,trsv

# What goes beyond the caches: a matrix of 4000 x 4000 doubles has 128 MB.
large=dgemv,dger,dsymv,dspmv,dsyr,dsyr2,dtrmv,dtrsv,dtpmv,dtpsv,dgbmv,dtbsv

quick_level2() {
  set -- --turns 7 --seconds 0.03
  heading "Level 2, one thread${PEER:+, beside $PEER}"
  beside_peer level2 --threads 1 --routines level2 --options N,T,U,UNN --sizes 8,32,200 "$@"
  heading "Level 2, one thread, an odd leading dimension${PEER:+, beside $PEER}"
  beside_peer level2-odd --threads 1 --routines gemv,trmv,trsv --options N,T,UNN --sizes 100 --spare 1 "$@"
  heading "Level 2, one thread, increments${PEER:+, beside $PEER}"
  beside_peer level2-increments --threads 1 --routines gemv,dsymv,dtrmv,dtrsv,dger --options N,T,U,UNN \
    --increments 2,-1 --sizes 100 "$@"
  heading "Level 2, one thread, large${PEER:+, beside $PEER}"
  beside_peer level2-large --threads 1 --options N,T,U,UNN,UTN --sizes 500,4000 \
    --routines dgemv,dsymv,dtrmv,dtrsv,dger "$@"
  heading "Level 2, $threads threads, beside one"
  compared level2-threads-serial --threads "$threads" --routines $threaded --options N,T,U,UNN \
    --sizes 200,1000 --peer self --peer-setting QTB_NUM_THREADS=1 "$@"
}

part_level2() {
  if [ -n "${BENCH_QUICK:-}" ]; then
    quick_level2
    return 0
  fi
  set -- --turns 7 --seconds 0.1
  if [ -n "${BENCH_LONG:-}" ]; then
    heading "Level 2, one thread, every option and increment${PEER:+, beside $PEER}"
    beside_peer level2 --threads 1 --routines level2 --options all --increments 1,2,-1 \
      --sizes 4,5,8,16,32,100,200,500,1000,2000,4000 "$@"
  else
    heading "Level 2, one thread${PEER:+, beside $PEER}"
    beside_peer level2 --threads 1 --routines level2 --options $some_options --sizes 4,8,16,32,200,500 "$@"
    heading "Level 2, one thread, every option${PEER:+, beside $PEER}"
    beside_peer level2-options --threads 1 --routines level2 --options all --sizes 100 "$@"
    heading "Level 2, one thread, increments${PEER:+, beside $PEER}"
    beside_peer level2-increments --threads 1 --routines level2 --options $some_options --increments 2,-1 \
      --sizes 100 "$@"
    heading "Level 2, one thread, large${PEER:+, beside $PEER}"
    beside_peer level2-large --threads 1 --options N,T,U,UNN,UTN --sizes 1000,2000,4000 --routines $large --bands 100 \
      "$@"
  fi
  heading "Level 2, one thread, an odd leading dimension${PEER:+, beside $PEER}"
  beside_peer level2-odd --threads 1 --routines gemv,ger,ssymv,dsymv,trmv,trsv --options N,T,U,UNN,LTN \
    --sizes 32,100,500 --spare 1 "$@"
  heading "Level 2, $threads threads, beside one"
  compared level2-threads-serial --threads "$threads" --routines $threaded --options N,T,U,UNN,UTN \
    --sizes 100,200,500,1000,4000 --peer self --peer-setting QTB_NUM_THREADS=1 "$@"
  [ -n "${PEER:-}" ] || return 0
  heading "Level 2, $threads threads, beside $PEER"
  beside_peer level2-threads-peer --threads "$threads" --routines $threaded --options N,T,U,UNN,UTN \
    --sizes 100,200,500,1000,4000 "$@"
}

part_kernels() {
  heading 'the inner kernels of products alone'
  "$build/bench/inner_kernels" | tee "$results/kernels-$tier.txt"
}

square_sizes=4,8,16,32,64,100,200,350,500,1000${BENCH_LONG:+,2000,4000}

part_gemm() {
  heading "products, one thread${PEER:+, beside $PEER}"
  beside_peer square --threads 1 --routines $products --sizes "$square_sizes"
  beside_peer oblong --threads 1 --routines $products \
    --shapes 1000x1000x32,200x200x32,16x1000x1000,16x200x200,1000x16x1000,200x16x200
  beside_peer options --threads 1 --routines $products --options NT,TN,TT --sizes 8,32,200,1000
}

part_flat() {
  shapes=
  for side in 1 2 3 4 5 8 12 16 17 24; do
    shapes=$shapes${shapes:+,}${side}x500x500,500x${side}x500,500x500x$side
  done
  heading "products with one short side, one thread${PEER:+, beside $PEER}"
  beside_peer flat --threads 1 --routines $products --options NN,NT,TN,TT --shapes "$shapes" --turns 7 --seconds 0.1
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

# The routines of Level 3 that cut their work into products.
beside_gemm=trsm,trmm,symm,hemm,syrk,herk,syr2k

quick_level3() {
  heading "Level 3 beside gemm, one thread${PEER:+, beside $PEER}"
  beside_peer level3 --threads 1 --routines "gemm,$beside_gemm" --options NN,LUNN,RLTN,LU,UN --sizes 8,32,100,300 \
    --turns 5 --seconds 0.03
  beside_peer level3-large --threads 1 --routines "gemm,$beside_gemm" --options NN,LUNN,LU,UN --sizes 1000 --turns 3 \
    --seconds 0.03
  beside_peer level3-flat --threads 1 --routines "$beside_gemm" --options LUNN,LL,LN --shapes 1000x4,4x1000 --turns 5 \
    --seconds 0.03
  heading "Level 3 beside gemm, $threads threads, beside one"
  compared level3-threads-serial --threads "$threads" --routines "$beside_gemm" --options LUNN,LL,LN \
    --sizes 100,300,1000 --peer self --peer-setting QTB_NUM_THREADS=1 --turns 3 --seconds 0.03
}

part_level3() {
  if [ -n "${BENCH_QUICK:-}" ]; then
    quick_level3
    return 0
  fi
  set -- --turns 7 --seconds 0.1
  heading "Level 3 beside gemm, one thread${PEER:+, beside $PEER}"
  beside_peer level3 --threads 1 --routines "gemm,$beside_gemm" --options NN,LUNN,LLTN,RUTN,RLNU,LU,RL,UN,LT,LC \
    --sizes 4,8,16,32,100,300,1000 "$@"
  beside_peer level3-flat --threads 1 --routines "$beside_gemm" --options LUNN,RLTN,LL,RU,LN \
    --shapes 1000x1,1000x4,1000x8,1000x16,1x1000,4x1000,8x1000,16x1000 "$@"
  heading "Level 3 beside gemm, $threads threads, beside one"
  compared level3-threads-serial --threads "$threads" --routines "$beside_gemm" --options LUNN,RLTN,LL,RU,LN \
    --sizes 17,32,64,100,200,300,600,1000 --peer self --peer-setting QTB_NUM_THREADS=1 "$@"
  [ -n "${PEER:-}" ] || return 0
  heading "Level 3 beside gemm, $threads threads, beside $PEER"
  beside_peer level3-threads-peer --threads "$threads" --routines "$beside_gemm" --options LUNN,RLTN,LL,RU,LN \
    --sizes 100,300,1000 "$@"
}

part_balance() {
  heading 'products, the share of an even cut over that of the busiest thread'
  "$build/bench/load_balance" | tee "$results/balance-$tier.txt"
}

for tier in $tiers; do
  # shellcheck disable=SC2046 # a line of three words
  set -- $(grep " $tier " "$results/tiers.txt")
  if [ "$3" = lacks ]; then
    echo "tier $tier: not on this processor"
    continue
  fi
  export QTB_DEBUG_CPU_TYPE="$1"
  for part in $parts; do "part_$part"; done
done

folder=$(dirname "$0")
if ls "$results"/*.csv > /dev/null 2>&1; then
  "$folder/summary.sh" "$results" > "$results/summary.md"
  echo "== summary: $results/summary.md"
fi
if ls "$results"/square-*.csv "$results"/level2-*.csv > /dev/null 2>&1; then
  "$folder/chart.sh" "$results"
  echo "== charts: $results/*.svg and *.png"
fi
if grep -E ',(wrong|crashed)(,|$)' "$results"/*.csv 2> /dev/null; then
  echo 'run.sh: wrong results, above' >&2
  exit 1
fi
