#!/bin/sh
# lapack_test.sh folder [type...]: LAPACK's testers, linear equations and eigenvalues, over the element types s d c z.
. "$(dirname "$0")/common.sh"
shift
[ $# != 0 ] || set -- s d c z
testers=$libraries/lapack
need $testers/xlintstd

# tester side program input: notes the failures of each group of tests, and the numbers of tests that ran.
tester() {
  run "$1" sh -c "$testers/$2 < $testers/$3"
  [ "$status" = 0 ] || echo "$2 $3: ended with status $status" >> "$1.failed"
  sed -nE 's/^ *(.*[^ ]) *: *([0-9]+) out of *[0-9]+ tests failed.*/\2 \1/p' printed | while read -r number group; do
    repeat "$number" "$2 $3: $group"
  done >> "$1.failed"
  grep -E '^ *\*\*\*|returned INFO|Error code|illegal' printed | sed "s/^ */$2 $3: /" >> "$1.failed" || true
  sed -nE 's/.*\( *([0-9]+) tests (run|done)\).*/\1/p; s/.* out of *([0-9]+) tests failed.*/\1/p' printed >> "$1.counts"
  cat printed >> "$1.printed"
}

for side in ours reference; do
  : > "$side".failed
  : > "$side".counts
  for type; do
    tester $side xlintst"$type" "$type"test.in
    tester $side xlintstrf"$type" "$type"test_rfp.in
    case $type in d) tester $side xlintstds dstest.in ;; z) tester $side xlintstzc zctest.in ;; esac
    for input in nep sep se2 svd glm gqr gsv csd lse; do
      [ ! -e $testers/$input.in ] || tester $side xeigtst"$type" $input.in
    done
    for input in ec ed gg gd sb sg bal bak gbal gbak bb; do
      tester $side xeigtst"$type" "$type$input.in"
    done
  done
  awk '{ sum += $1 } END { print sum }' $side.counts > "$side".count
done
verdict "LAPACK testers"
