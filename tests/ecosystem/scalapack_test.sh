#!/bin/sh
# scalapack_test.sh folder [tester...]: ScaLAPACK's testers and those of its parallel BLAS, with two ranks.
. "$(dirname "$0")/common.sh"
shift
testers=$libraries/scalapack/openmpi-tests
need $testers/xdlu /usr/bin/mpirun
cp $testers/*.dat $testers/PBLAS/*.dat .
if [ $# = 0 ]; then
  set -- $testers/x[sdcz][a-z]* $testers/PBLAS/?pb?tst
fi

for side in ours reference; do
  : > "$side".failed
  : > "$side".counts
  for tester; do
    name=$(basename "$tester")
    mpi_run "$side" "$tester"
    [ "$status" = 0 ] || echo "$name: ended with status $status" >> "$side".failed
    # Both kinds of summary: the number of tests with a verdict, and a table by routine.
    awk -v name="$name" '
      /tests completed and (passed|failed)|tests completed without checking|tests passed|tests failed/ { ran += $1 }
      /tests completed and failed|tests failed/ { bad += $1 }
      /^ *\|  *P[SDCZ]/ { ran += $4 + $5; bad += $5 }
      END { print ran + 0, bad + 0 }' printed > numbers
    read -r ran bad < numbers
    [ "$ran" != 0 ] || echo "$name: no test ran" >> "$side".failed
    repeat "$bad" "$name" >> "$side".failed
    echo "$ran" >> "$side".counts
  done
  awk '{ sum += $1 } END { print sum }' "$side".counts > "$side".count
done
verdict "ScaLAPACK testers"
