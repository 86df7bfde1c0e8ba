#!/bin/sh
# r_test.sh folder: R's matrix products and solves: what becomes of NaN and infinities, as R's own BLAS checks ask, and
# residuals. R puts the system's libraries first by itself, unless told.
. "$(dirname "$0")/common.sh"
need /usr/bin/Rscript /usr/lib/R/lib/libR.so
cp "$scripts/products.R" products.R

for side in ours reference; do
  R_LD_LIBRARY_PATH=$work/$side:/usr/lib/R/lib
  export R_LD_LIBRARY_PATH
  run $side Rscript --vanilla products.R
  tally $side
done
verdict "R"
