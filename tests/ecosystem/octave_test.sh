#!/bin/sh
# octave_test.sh folder: Octave's built-in tests of its functions of linear algebra, and residuals of solved problems.
. "$(dirname "$0")/common.sh"
need /usr/bin/octave-cli
cp "$scripts/residuals.m" residuals.m

for side in ours reference; do
  run $side octave-cli --no-gui --norc --quiet --path "$work" residuals.m
  tally $side
done
verdict "Octave"
