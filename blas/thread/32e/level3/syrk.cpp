// The front ends of the rank-k updates, syrk and herk: a dispatch slot on the whole problem, or a parallel driver.

#include "blas/thread/32e/level3/rank_update.h"
#include "blas/thread/32e/level3/strips.h"
#include "blas/thread/32e/level3/syrk_decision.h"
#include "blas/thread/32e/level3/syrk_omp.h"

namespace qtb {
namespace {

// By tiles nothing of alpha, beta and k is looked at: what is special about them is told apart by the slots.
template <auto slot, auto body, auto of_order_4, auto driver, class... A>
void syrk_tiles_entry(const QtbInt *n, A... arguments) {
  const SyrkDecision decision = syrk_decision(*n, ThisProcess{});
  switch (decision.road) {
    case syrk_of_order_4: return of_order_4(arguments...);
    case syrk_small: return body(arguments...);
    case syrk_serial: return slot(arguments...);
    case syrk_parallel: return driver(decision.threads, arguments...);
  }
}

// A Hermitian triangle gets its beta here, so that strips and diagonal blocks add to it alike.
template <auto slot, auto driver, class T, class Factor>
void syrk_strips_entry(const char *uplo, const char *trans, const QtbInt *n, const QtbInt *k, const Factor *alpha,
                       const T *a, const QtbInt *lda, const Factor *beta, T *c, const QtbInt *ldc) {
  static constexpr Real<T> one = 1;
  if (*n <= 0 || update_changes_nothing(alpha, k, beta)) return;
  if constexpr (is_hermitian<T, Factor>) {
    scale_hermitian(*uplo, *n, *beta, c, *ldc);
    if (update_adds_nothing(alpha, k)) return;
    beta = &one;
  }
  const QtbInt nthreads = strip_threads(*n, ThisProcess{});
  if (nthreads == 1) return slot(uplo, trans, n, k, alpha, a, lda, beta, c, ldc);
  driver(nthreads, uplo, trans, n, k, alpha, a, lda, beta, c, ldc);
}

}  // namespace
}  // namespace qtb

// The kernel for order 4 is dsyrk's; the others take theirs of diagonal blocks.
#define QTB_SYRK_OF_ORDER_4_dsyrk qtb_blas_xdsyrk_n4
#define QTB_SYRK_OF_ORDER_4_ssyrk qtb_blas_xssyrk_body
#define QTB_SYRK_OF_ORDER_4_csyrk qtb_blas_xcsyrk_body
#define QTB_SYRK_OF_ORDER_4_zsyrk qtb_blas_xzsyrk_body
#define QTB_SYRK_OF_ORDER_4_cherk qtb_blas_xcherk_body
#define QTB_SYRK_OF_ORDER_4_zherk qtb_blas_xzherk_body

extern "C" {
#define QTB_SYRK_FRONT_END(name, shape, T)                                                                   \
  QTB_FUNCTION(shape, T, qtb_blas_##name) {                                                                  \
    if (qtb::syrk_takes_tiles(qtb::ThisProcess{}))                                                           \
      return qtb::syrk_tiles_entry<&qtb_blas_x##name, &qtb_blas_x##name##_body, &QTB_SYRK_OF_ORDER_4_##name, \
                                   &qtb_blas_##name##_omp>(n, QTB_ARGS(shape));                              \
    return qtb::syrk_strips_entry<&qtb_blas_x##name, &qtb_blas_##name##_strips_omp>(QTB_ARGS(shape));        \
  }
QTB_FOR_EACH_SYRK(QTB_SYRK_FRONT_END)
}
