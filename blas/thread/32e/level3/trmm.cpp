// The front ends of the triangular products and solves, trmm and trsm: the dispatch slot on the whole problem, or the
// parallel driver. Without columns nothing is called; a matrix without rows goes the way of others.

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level3/trmm_decision.h"
#include "blas/thread/32e/level3/trmm_omp.h"
#include "blas/thread/drivers.h"

extern "C" {
#define QTB_TRMM_FRONT_END(name, T, solve)                                                 \
  QTB_FUNCTION(trmm, T, qtb_blas_##name) {                                                 \
    if (*n <= 0) return;                                                                   \
    const qtb::TrmmDecision decision =                                                     \
        qtb::trmm_decision<T>({solve, is_letter(*side, 'L'), *m, *n}, qtb::ThisProcess{}); \
    if (decision.threads == 1) return qtb_blas_x##name(QTB_ARGS(trmm));                    \
    return qtb_blas_##name##_omp(&decision, QTB_ARGS(trmm));                               \
  }
#define QTB_PRODUCT_FRONT_END(name, T) QTB_TRMM_FRONT_END(name, T, false)
#define QTB_SOLVE_FRONT_END(name, T) QTB_TRMM_FRONT_END(name, T, true)
QTB_FOR_EACH_TRMM(QTB_PRODUCT_FRONT_END)
QTB_FOR_EACH_TRSM(QTB_SOLVE_FRONT_END)
}
