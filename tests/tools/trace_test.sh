#!/bin/sh
# trace_test.sh build_folder: runs a program with known calls under qtb-trace, on the companions of both widths and on
# the distribution's library, and looks for those calls in the rows.
set -eu

build=$1
tools=$build/tools
sources=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"

# program name library flags...
program() {
  name=$1 library=$2
  shift 2
  "${CC:-cc}" -std=gnu11 -Wall -Wextra -Werror "$@" -I "$sources/../../include" "$sources/traced.c" \
    -L "$build/interfaces" -l:"$library" -lpthread -o "$name"
}
program narrow libblas.so.3
program wide libblas64.so.3 -DCBLAS_ILP64

# expect text: fails unless a row of rows.csv begins so, up to the column of calls.
expect() {
  awk -F, -v OFS=, '{ print $1, $2, $3, $4, $5, $6, $7, $10 }' rows.csv > columns
  grep -qxF -e "$1" columns || { echo "no row $1 in" && cat rows.csv && exit 1; }
}
expect_calls() {
  expect "dgemm_,NT,20,30,40,,,10"
  expect "cblas_dgemm,TN,20,30,40,,,1"
  expect "cblas_dtrsm,LUNU,5,6,,,,1"
  expect "cblas_dsbmv,L,,9,3,,,1"
  expect "cblas_cdotc,,,2,,,,1"
  expect "cblas_idamax,,,4,,,,1"
  expect "ddot_,,,100,,,,2000"
  # The C interface of some libraries calls their Fortran names: those are no calls of the program.
  [ "$(wc -l < rows.csv)" -eq 8 ] || { echo "calls that nobody made:" && cat rows.csv && exit 1; }
}

LD_LIBRARY_PATH=$build/interfaces
export LD_LIBRARY_PATH
QTB_NUM_THREADS=1 QTB_DEBUG_CPU_TYPE=1 "$tools/qtb-trace" --csv rows.csv --output table.txt ./narrow
expect_calls
[ "$(grep -c ',1,sse3,' rows.csv)" -eq 7 ] || { echo "not the tier and the threads:" && cat rows.csv && exit 1; }
grep -q "2015 calls in " table.txt || { cat table.txt && exit 1; }
grep -q "libblas.so.3, tier sse3" table.txt || { cat table.txt && exit 1; }
grep -qE "^cblas_dtrsm +LUNU m=5 n=6 +1 +1 " table.txt || { cat table.txt && exit 1; }

rm rows.csv
"$tools/qtb-trace" --csv rows.csv ./wide 2> table.txt
expect_calls
grep -q "^qtb-trace: process" table.txt || { echo "no table on standard error" && exit 1; }

# A team counts as many threads as it was asked for.
rm rows.csv
QTB_DYNAMIC=FALSE QTB_NUM_THREADS=3 QTB_DEBUG_CPU_TYPE=1 "$tools/qtb-trace" --csv rows.csv ./narrow 2> table.txt
grep -q "^dgemm_,NT,20,30,40,,,3,sse3,10," rows.csv || { echo "not three threads:" && cat rows.csv && exit 1; }

# A child tells its own calls alone.
"$tools/qtb-trace" --csv 'rows-%p.csv' --output 'table-%p.txt' ./narrow fork
rows=$(cat rows-*.csv | grep -c '^ddot_,')
if [ "$rows" -ne 2 ] || ! grep -q "process [0-9]*, 1 calls" table-*.txt; then
  cat rows-*.csv table-*.txt && exit 1
fi

# A library that the program loads as a plugin, with a BLAS that nobody else has.
program plugin.so libblas.so.3 -shared -fPIC
"${CC:-cc}" -std=gnu11 -Wall -Wextra -Werror "$sources/plugin_host.c" -ldl -o host
"$tools/qtb-trace" --csv rows.csv ./host ./plugin.so 2> table.txt
expect_calls

# Any other library.
distribution=/usr/lib/x86_64-linux-gnu/blas
if [ -e $distribution/libblas.so.3 ]; then
  rm -f rows.csv
  LD_LIBRARY_PATH=$distribution "$tools/qtb-trace" --csv rows.csv ./narrow 2> table.txt
  expect_calls
  grep -q "tier -" table.txt || { cat table.txt && exit 1; }
fi

# Nothing is told of a program that makes no calls, and its exit status is the program's.
"$tools/qtb-trace" true 2> table.txt
[ ! -s table.txt ] || { cat table.txt && exit 1; }
status=0
"$tools/qtb-trace" sh -c 'exit 5' || status=$?
[ "$status" -eq 5 ] || { echo "exit status $status, not the program's" && exit 1; }

"$tools/qtb-trace" --help | grep -q "^usage: qtb-trace"
"$tools/qtb-trace" --version | grep -qE "^qtb-trace [0-9.]+$"
for wrong in --no-such --csv "--integers 16 true" ""; do
  status=0
  # shellcheck disable=SC2086 # a list of words
  "$tools/qtb-trace" $wrong 2> message || status=$?
  if [ "$status" -ne 2 ] || ! grep -q "^qtb-trace: " message; then
    echo "qtb-trace $wrong: exit status $status" && exit 1
  fi
done
echo "the calls of three programs, on the companions and on another library"
