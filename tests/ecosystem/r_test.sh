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
  if [ "$status" != 0 ] || ! grep -q '^count ' printed; then
    cat printed && exit 1
  fi
  sed -n 's/^failed //p' printed > "$side".failed
  sed -n 's/^count //p' printed > "$side".count
done
verdict "R"
