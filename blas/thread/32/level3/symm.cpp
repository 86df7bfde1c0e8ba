// The front ends of the products with a symmetric or Hermitian matrix, symm and hemm: the dispatch slot on the whole
// problem, or the parallel driver. Where nothing changes nothing is called.

#include "blas/thread/32/level3/symm_decision.h"
#include "blas/thread/32/level3/symm_omp.h"
#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/drivers.h"

namespace qtb {
namespace {

template <class T, auto slot, auto driver>
void symm(QTB_PARAMS_symm(T)) {
  if (*m <= 0 || *n <= 0) return;
  if (is_zero(*alpha)) {
    if (is_one(*beta)) return;
    // Real products leave C to the caller's thread, however large it is; complex ones let their slots apply beta.
    if constexpr (!is_complex<T>) return GemmSlots<T>::scale_c(m, n, beta, c, ldc);
  }
  const QtbInt nthreads = symm_threads(*m, *n, ThisProcess{});
  if (nthreads == 1) return slot(QTB_ARGS(symm));
  driver(nthreads, QTB_ARGS(symm));
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_SYMM_FRONT_END(name, T) \
  QTB_FUNCTION(symm, T, qtb_blas_##name) { qtb::symm<T, &qtb_blas_x##name, &qtb_blas_##name##_omp>(QTB_ARGS(symm)); }
QTB_FOR_EACH_SYMM(QTB_SYMM_FRONT_END)
QTB_FOR_EACH_HEMM(QTB_SYMM_FRONT_END)
}
