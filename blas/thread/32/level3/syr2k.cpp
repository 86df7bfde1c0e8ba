// The front ends of the rank-2k updates, syr2k and her2k: the dispatch slot on the whole problem, or the parallel
// driver. Where nothing changes nothing is called.

#include "blas/thread/32/level3/syr2k_omp.h"
#include "blas/thread/32e/level3/rank_update.h"
#include "blas/thread/32e/level3/strips.h"

namespace qtb {
namespace {

template <auto slot, auto driver, class T, class Beta>
void syr2k(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const T *alpha, const T *a,
           const QtbInt *lda, const T *b, const QtbInt *ldb, const Beta *beta, T *c, const QtbInt *ldc) {
  static constexpr Real<T> one = 1;
  if (*n <= 0 || update_changes_nothing(alpha, k, beta)) return;
  bool serial = false;
  if constexpr (is_hermitian<T, Beta>) {
    // The triangle gets its beta here, so that strips and diagonal blocks add to it alike.
    scale_hermitian(*uplo, *n, *beta, c, *ldc);
    if (update_adds_nothing(alpha, k)) return;
    beta = &one;
  } else if constexpr (!is_complex<T>) {
    serial = *k == 0;  // one pass over the triangle; in complex types it goes the way of all
  }
  const QtbInt nthreads = serial ? 1 : strip_threads(*n, ThisProcess{});
  if (nthreads == 1) return slot(uplo, trans, n, k, alpha, a, lda, b, ldb, beta, c, ldc);
  driver(nthreads, uplo, trans, n, k, alpha, a, lda, b, ldb, beta, c, ldc);
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_SYR2K_FRONT_END_OF(shape, name, T)                                     \
  QTB_FUNCTION(shape, T, qtb_blas_##name) {                                        \
    return qtb::syr2k<&qtb_blas_x##name, &qtb_blas_##name##_omp>(QTB_ARGS(shape)); \
  }
#define QTB_SYR2K_FRONT_END(name, T) QTB_SYR2K_FRONT_END_OF(syr2k, name, T)
#define QTB_HER2K_FRONT_END(name, T) QTB_SYR2K_FRONT_END_OF(her2k, name, T)
QTB_FOR_EACH_SYR2K(QTB_SYR2K_FRONT_END)
QTB_FOR_EACH_HER2K(QTB_HER2K_FRONT_END)
}
