// The one driver of trmm and trsm: the routine's slot on each thread's slab of B, with the whole triangle.
#pragma once

#include "blas/shapes.h"
#include "blas/thread/32e/level3/trmm_decision.h"

namespace qtb {

template <class T, auto slot>
void trmm_by_slabs(const TrmmDecision &decision, QTB_PARAMS_trmm(T)) {
  const bool left = is_letter(*side, 'L');
  run_slabs(decision.threads, slab_extent(left, *m, *n), decision.unit, [=](GemmRange slab) {
    if (left)
      slot(side, uplo, transa, diag, m, &slab.count, alpha, a, lda, b + slab.first * *ldb, ldb);
    else
      slot(side, uplo, transa, diag, &slab.count, n, alpha, a, lda, b + slab.first, ldb);
  });
}

}  // namespace qtb
