// The front ends of the symmetric and triangular Level-2 routines with a parallel path: the dispatch slot on the whole
// problem, or the parallel driver with a number of threads. An empty matrix calls nothing, and the vectors stay as they
// are.

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level2/l2_decision.h"
#include "blas/thread/32e/level2/l2_omp.h"
#include "blas/thread/drivers.h"

extern "C" {
// The decision stands in a procedure of its own, so that a small problem goes to its slot by two tests and a jump.
#define QTB_LEVEL2(name, shape, T, ...)                                                            \
  [[gnu::noinline]] static QTB_FUNCTION(shape, T, decide_##name) {                                 \
    const QtbInt nthreads = qtb::level2_threads(qtb::level2_limits::name, *n, qtb::ThisProcess{}); \
    if (nthreads == qtb::level2_serial) return qtb_blas_x##name(QTB_ARGS(shape));                  \
    return qtb_blas_##name##_omp(nthreads, QTB_ARGS(shape));                                       \
  }                                                                                                \
  QTB_FUNCTION(shape, T, qtb_blas_##name) {                                                        \
    if (*n <= 0) return;                                                                           \
    if (*n < qtb::level2_limits::name.min_n) return qtb_blas_x##name(QTB_ARGS(shape));             \
    return decide_##name(QTB_ARGS(shape));                                                         \
  }
#include "blas/thread/32e/level2/l2.def"
#undef QTB_LEVEL2
}
