// gemm: C := alpha*op(A)*op(B) + beta*C on all threads where that pays, the front ends of the four types: the dispatch
// slot on the whole problem, or in slices of rows, or the parallel driver.

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level3/gemm_decision.h"
#include "blas/thread/32e/level3/gemm_omp.h"
#include "blas/thread/drivers.h"

namespace qtb {
namespace {

// The rows of a slice of a serial problem.
constexpr QtbInt serial_slice_rows = 128;

template <class T, auto slot>
void gemm_by_slices(QTB_PARAMS_gemm(T)) {
  const QtbInt a_step = is_letter(*transa, 'N') ? 1 : *lda;
  for (QtbInt row = 0; row < *m; row += serial_slice_rows) {
    const QtbInt left = *m - row, rows = left < serial_slice_rows ? left : serial_slice_rows;
    slot(transa, transb, &rows, n, k, alpha, a + row * a_step, lda, b, ldb, beta, c + row, ldc);
  }
}

}  // namespace
}  // namespace qtb

extern "C" {
// The decision stands in a procedure of its own, so that a tiny problem goes to its slot by a few tests and a jump.
#define QTB_GEMM_FRONT_END(t, T)                                                                     \
  [[gnu::noinline]] static QTB_FUNCTION(gemm, T, decide_##t##gemm) {                                 \
    const qtb::GemmDecision decision = qtb::gemm_decision<T>(*m, *n, *k, qtb::ThisProcess{});        \
    switch (decision.road) {                                                                         \
      case qtb::gemm_serial: return qtb_blas_x##t##gemm(QTB_ARGS(gemm));                             \
      case qtb::gemm_in_slices: return qtb::gemm_by_slices<T, &qtb_blas_x##t##gemm>(QTB_ARGS(gemm)); \
      case qtb::gemm_parallel: return qtb_blas_##t##gemm_omp(&decision, QTB_ARGS(gemm));             \
    }                                                                                                \
  }                                                                                                  \
  QTB_FUNCTION(gemm, T, qtb_blas_##t##gemm) {                                                        \
    if (*m <= 0 || *n <= 0) return;                                                                  \
    if (qtb::gemm_is_tiny(*m, *n, *k)) return qtb_blas_x##t##gemm(QTB_ARGS(gemm));                   \
    decide_##t##gemm(QTB_ARGS(gemm));                                                                \
  }
QTB_FOR_EACH_GEMM(QTB_GEMM_FRONT_END)
}
