// The front ends of the products of a general matrix and a vector: the dispatch slot on the whole problem, or the
// parallel driver with a number of threads. Without rows or columns nothing is called, and y stays as it is.

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level2/gemv_decision.h"
#include "blas/thread/32e/level2/gemv_omp.h"
#include "blas/thread/drivers.h"

extern "C" {
// The decision stands in a procedure of its own, so that a small problem goes to its slot by a few tests and a jump.
#define QTB_GEMV(name, T, ...)                                                                          \
  [[gnu::noinline]] static QTB_FUNCTION(gemv, T, decide_##name) {                                       \
    const QtbInt nthreads =                                                                             \
        qtb::gemv_threads(qtb::gemv_limits::name, qtb::gemv_split(*trans), *m, *n, qtb::ThisProcess{}); \
    if (nthreads == qtb::gemv_serial) return qtb_blas_x##name(QTB_ARGS(gemv));                          \
    return qtb_blas_##name##_omp(nthreads, QTB_ARGS(gemv));                                             \
  }                                                                                                     \
  QTB_FUNCTION(gemv, T, qtb_blas_##name) {                                                              \
    if (*m <= 0 || *n <= 0) return;                                                                     \
    constexpr QtbInt small_dim = qtb::gemv_limits::name.small_dim;                                      \
    if (*m < small_dim && *n < small_dim) return qtb_blas_x##name(QTB_ARGS(gemv));                      \
    return decide_##name(QTB_ARGS(gemv));                                                               \
  }
#include "blas/thread/32e/level2/gemv.def"
#undef QTB_GEMV
}
