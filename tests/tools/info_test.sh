#!/bin/sh
# info_test.sh build_folder: what qtb-info says of this machine and of a process, and how it takes its arguments.
set -eu

build=$1
info=$build/tools/qtb-info
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
unset QTB_DEBUG_CPU_TYPE QTB_TIER QTB_NUM_THREADS QTB_DOMAIN_NUM_THREADS QTB_DYNAMIC OMP_NUM_THREADS

# expect pattern: fails unless a line of the output is such.
expect() { grep -qE -e "$1" output || { echo "no line $1 in" && cat output && exit 1; }; }

"$info" > output
expect "Version [0-9]+\.[0-9]+\.[0-9]+ "
expect "^  vendor +[^ ]"
expect "^  companions +(def|sse3|ssse3|sse42|avx): the highest"
expect "^  libqtb.so +(def|sse3|ssse3|sse42|avx): the "
expect "^  a call takes +[0-9]+ at most: "
expect "^  order 1000 +[0-9]+ buffers, [0-9.]+ MiB$"

QTB_DEBUG_CPU_TYPE=1 "$info" > output
expect "^  libqtb.so +sse3: as QTB_DEBUG_CPU_TYPE asks"
expect "^  companions +sse3: as QTB_DEBUG_CPU_TYPE asks"
QTB_TIER=def "$info" > output
expect "^  libqtb.so +def: as QTB_TIER asks"
QTB_TIER=native "$info" > output
expect "^  libqtb.so +(def|sse3|ssse3|sse42|avx): as QTB_TIER asks"
QTB_TIER=sse3 QTB_DEBUG_CPU_TYPE=0 "$info" > output
expect "^  libqtb.so +def: as QTB_DEBUG_CPU_TYPE asks"
QTB_TIER=nonsense "$info" > output
expect "^QTB WARNING: QTB_TIER=nonsense is no tier of this library\.$"
expect "^  libqtb.so +(def|sse3|ssse3|sse42|avx): the "
QTB_DEBUG_CPU_TYPE=nonsense "$info" > output
expect "^  libqtb.so +(def|sse3|ssse3|sse42|avx): the "
QTB_DYNAMIC=FALSE QTB_NUM_THREADS=7 "$info" > output
expect "^  a call takes +7 at most: the number given, with dynamic mode off"
expect "^  QTB_NUM_THREADS=7$"
QTB_NUM_THREADS=1 "$info" > output
expect "^  a call takes +1 at most: "
taskset -c 0 "$info" > output
[ "$(nproc)" -eq 1 ] || expect "^  a call takes +1 at most: the process may not use all"
QTB_DISABLE_FAST_MM=1 "$info" > output
expect "^  none are kept"

# A process that has loaded a companion, and one that has loaded no BLAS at all.
LD_PRELOAD="$build/interfaces/libblas.so.3" sleep 100 &
with=$!
sleep 100 &
without=$!
trap 'kill $with $without; rm -rf "$work"' EXIT
tries=0
until grep -q libblas /proc/$with/maps || [ $tries -gt 100 ]; do
  tries=$((tries + 1))
  sleep 0.1
done
"$info" --pid $with > output
expect "^QTB [0-9]+\.[0-9]+\.[0-9]+ +/.*/libblas\.so"
"$info" --pid $without > output
expect "has loaded no BLAS"

"$info" --version > output
expect "Version [0-9]"
"$info" --help > output
expect "^usage: qtb-info"
# refused status arguments...
refused() {
  expected=$1 status=0
  shift
  "$info" "$@" > output 2> message || status=$?
  if [ "$status" -ne "$expected" ] || ! grep -q "^qtb-info: " message; then
    echo "qtb-info $*: exit status $status and" && cat message && exit 1
  fi
}
refused 2 --no-such
refused 2 --pid
refused 2 --pid 12x
refused 2 --pid -1
refused 2 --help me
refused 2 --selftest /no/such/library.so
refused 2 --selftest "$build/interfaces/libblas64.so.3"
refused 1 --pid 4194305
echo "this machine, two processes, and wrong arguments"
