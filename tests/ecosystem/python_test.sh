#!/bin/sh
# python_test.sh folder what module...: the suites of Python modules that use a BLAS.
. "$(dirname "$0")/common.sh"
what=$2
shift 2
need /usr/bin/python3 /usr/lib/python3/dist-packages/pytest /usr/lib/python3/dist-packages/scipy

for side in ours reference; do
  run "$side" /usr/bin/python3 -m pytest -p no:cacheprovider -q -rfE --pyargs "$@"
  grep -qE '^[0-9].* passed' printed || { cat printed && exit 1; }
  sed -nE 's/^(FAILED|ERROR) ([^ ]*).*/\2/p' printed > "$side".failed
  tail -1 printed | grep -oE '[0-9]+ (passed|failed)' | awk '{ sum += $1 } END { print sum }' > "$side".count
  tail -1 printed
done
verdict "$what"
