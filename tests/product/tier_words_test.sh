#!/bin/sh
# tier_words_test.sh source_folder tier...: what is told of a tier by hand, outside of what is compiled, is told of
# every one. The arguments are all tiers, lowest first.
set -eu

source=$1
shift
failures=0
number=0

# has file pattern what: the file has a line of this pattern, or is told what to have.
has() {
  grep -q "$2" "$source/$1" && return 0
  echo "$1: write $3"
  failures=$((failures + 1))
}

for tier in "$@"; do
  has README.md "^| $tier | $number |" "a row for the tier $tier, number $number, into the table of kernels"
  number=$((number + 1))
done

echo "$number tiers, $failures missing"
[ "$number" -gt 0 ] && [ "$failures" -eq 0 ]
