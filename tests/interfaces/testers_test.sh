#!/bin/sh
# testers_test.sh folder tier...: the distribution's testers of Fortran's and C's interface, of both widths of integers,
# on the companions in a folder: every computation, in rows and columns, and every error exit. The tiers are numbers as
# QTB_DEBUG_CPU_TYPE takes them; without one the library chooses.
set -eu

folder=$1
shift
root=/usr/lib/x86_64-linux-gnu
if [ ! -x $root/blas/xdcblat3 ] || [ ! -x $root/blas64/xdcblat3 ]; then
  echo "the packages libblas-test and libblas64-test are not here"
  exit 77
fi
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
LD_LIBRARY_PATH=$folder
export LD_LIBRARY_PATH
passed=0

# Runs a tester; its report is what it prints, or the file that it names itself.
run() {  # what, program, input, report or -
  if ! "$2" < "$3" > printed 2>&1; then
    echo "$1 ended early" && cat printed && exit 1
  fi
  report=printed
  [ "$4" = - ] || report=$4
  if grep -E 'FAIL|\*{3}|SUSPECT|ABANDONED' "$report"; then
    echo "$1 is not content" && exit 1
  fi
  passed=$((passed + $(grep -cE 'PASS' "$report")))
  rm -f "$report"
}

each_tester() {  # what, folder of the testers
  for type in s d c z; do
    run "$1 xblat1$type" "$2/xblat1$type" /dev/null -
    run "$1 xblat2$type" "$2/xblat2$type" "$2/${type}blat2.in" ${type}blat2.out
    run "$1 xblat3$type" "$2/xblat3$type" "$2/${type}blat3.in" ${type}blat3.out
    run "$1 x${type}cblat1" "$2/x${type}cblat1" /dev/null -
    run "$1 x${type}cblat2" "$2/x${type}cblat2" "$2/${type}in2" -
    run "$1 x${type}cblat3" "$2/x${type}cblat3" "$2/${type}in3" -
  done
}

for tier in "${@:-}"; do
  if [ -n "$tier" ]; then
    QTB_DEBUG_CPU_TYPE=$tier
    export QTB_DEBUG_CPU_TYPE
  fi
  each_tester "tier ${tier:-of the processor}, 32 bits," $root/blas
  each_tester "tier ${tier:-of the processor}, 64 bits," $root/blas64
done
echo "$passed reports of PASS"
