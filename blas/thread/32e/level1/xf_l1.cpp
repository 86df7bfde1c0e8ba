// The front ends of the Level-1 routines with a parallel path: the dispatch slot on the whole problem, or the parallel
// driver with a number of threads.

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level1/xf_l1_decision.h"
#include "blas/thread/32e/level1/xf_l1_omp.h"
#include "blas/thread/drivers.h"
#include "blas/thread/process.h"

extern "C" {
// The decision stands in a procedure of its own, so that a short vector goes to its slot by a load, a test and a jump.
#define QTB_LEVEL1_FRONT_END(name, shape, T)                                                                     \
  [[gnu::noinline]] static QTB_FUNCTION(shape, T, decide_##name) {                                               \
    const QtbInt nthreads = qtb::level1_threads(qtb::level1_limits::name, *n, *incx, *incy, qtb::ThisProcess{}); \
    if (nthreads == qtb::level1_serial) return qtb_blas_x##name(QTB_ARGS(shape));                                \
    return qtb_blas_##name##_omp(QTB_OMP_ARGS_##shape);                                                          \
  }                                                                                                              \
  QTB_FUNCTION(shape, T, qtb_blas_##name) {                                                                      \
    if (*n < qtb::level1_limits::name.min_n) return qtb_blas_x##name(QTB_ARGS(shape));                           \
    return decide_##name(QTB_ARGS(shape));                                                                       \
  }
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_LEVEL1_FRONT_END(name, shape, T)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_LEVEL1_FRONT_END(name, shape, T)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
}
