// The one driver of symm and hemm: the routine's slot on each thread's slab of B and C, with the whole of A.
#pragma once

#include "blas/shapes.h"
#include "blas/thread/32e/level3/slabs.h"

namespace qtb {

template <class T, auto slot>
void symm_by_slabs(QtbInt nthreads, QTB_PARAMS_symm(T)) {
  constexpr QtbInt anywhere = 1;
  const bool left = is_letter(*side, 'L');
  run_slabs(nthreads, slab_extent(left, *m, *n), anywhere, [=](GemmRange slab) {
    if (left)
      slot(side, uplo, m, &slab.count, alpha, a, lda, b + slab.first * *ldb, ldb, beta, c + slab.first * *ldc, ldc);
    else
      slot(side, uplo, &slab.count, n, alpha, a, lda, b + slab.first, ldb, beta, c + slab.first, ldc);
  });
}

}  // namespace qtb
