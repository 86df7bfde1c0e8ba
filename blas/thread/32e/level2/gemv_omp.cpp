// The parallel products of a general matrix and a vector. See gemv_omp.h for their contract.
//
// There is no partial y, no work memory and no reduction: an element of y is computed by one thread, from a whole row
// or column of the matrix. A result depends on the team only by what the slot makes of a share's shape.

#include "blas/thread/32e/level2/gemv_omp.h"

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level2/gemv_share.h"
#include "blas/thread/team.h"

namespace qtb {
namespace {

template <class T, auto slot>
void gemv(QtbInt nthreads, QTB_PARAMS_gemv(T)) {
  const GemvSplit split = gemv_split(*trans);
  run_team(nthreads, [=](const Team &team) {
    if (team.size == 1) return slot(QTB_ARGS(gemv));
    const Level1Share share = gemv_share(split, *m, *n, team.size, team.rank);
    if (split == GemvSplit::rows)
      slot(trans, &share.len, n, alpha, a + share.start, lda, x, incx, beta, y + level1_offset(share, *m, *incy), incy);
    else
      slot(trans, m, &share.len, alpha, a + share.start * *lda, lda, x, incx, beta, y + level1_offset(share, *n, *incy),
           incy);
  });
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_GEMV(name, T, ...)                                      \
  void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_gemv(T)) { \
    qtb::gemv<T, &qtb_blas_x##name>(nthreads, QTB_ARGS(gemv));      \
  }
#include "blas/thread/32e/level2/gemv.def"
#undef QTB_GEMV
}
