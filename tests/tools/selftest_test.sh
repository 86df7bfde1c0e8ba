#!/bin/sh
# selftest_test.sh build_folder: the self-test passes on the library as it was built, in every tier, and on a companion,
# and finds a routine that is wrong in one element by a few of the last bits, and one that traps.
set -eu

build=$1
info=$build/tools/qtb-info
sources=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
unset QTB_DEBUG_CPU_TYPE

"$info" --selftest > output || { cat output && exit 1; }
cat output
tail -n 1 output | grep -qx passed
QTB_DEBUG_CPU_TYPE=1 "$info" --selftest "$build/interfaces/libblas.so.3" > companion || { cat companion && exit 1; }
[ "$(grep -c "^tier sse3, .* routines, " companion)" -eq 2 ] || { cat companion && exit 1; }
routines=$(grep -cE '^QTB_ROUTINE' "$sources/../../blas/routines.def")
tiers=$(grep -c '^tier ' output)
complete=$(grep -c ": $routines routines, " output)
if [ "$tiers" -lt 2 ] || [ "$complete" -ne "$tiers" ]; then
  echo "not all $routines routines in all tiers" && exit 1
fi

"${CC:-cc}" -std=c11 -shared -fPIC -O1 -I "$sources/../../include" "$sources/broken.c" \
  -L "$build" -Wl,--no-as-needed -l:libqtb.so -ldl -Wl,-rpath,"$build" -o broken.so
for how in wrong trap; do
  status=0
  QTB_DEBUG_CPU_TYPE=0 BROKEN=$how "$info" --selftest "$work/broken.so" > output || status=$?
  [ "$status" -eq 1 ] || { echo "$how: exit status $status" && cat output && exit 1; }
  grep -q "^FAILED dsymv: " output || { echo "$how: the routine is not named" && cat output && exit 1; }
  grep "^FAILED" output | grep -qvE "^FAILED( dsymv: |$)" && { echo "$how: others fail" && cat output && exit 1; }
  tail -n 1 output | grep -qx FAILED
done
echo "the library passes, and what was broken on purpose is named"
