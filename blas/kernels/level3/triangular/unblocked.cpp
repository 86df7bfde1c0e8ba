// Triangular products and solves without packing, by all their options (unblocked.h).
#include "blas/kernels/level3/triangular/unblocked.h"
#include "blas/kernels/level3/triangular/unblocked_left.h"
#include "blas/kernels/level3/triangular/unblocked_right.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(trmm, T, product_unblocked) {
  if (*m <= 0 || *n <= 0) return;
  const TriForm form = read_form<T>(side, uplo, transa, diag);
  if (!form.left) return unblocked_from_right<false>(form, *m, *n, is_one(*alpha) ? nullptr : alpha, a, *lda, b, *ldb);
  scale_columns<T>(m, n, alpha, b, ldb);
  unblocked_from_left<false>(form, *m, *n, a, *lda, b, *ldb);
}

template <class T>
QTB_FUNCTION(trmm, T, solve_unblocked) {
  static_cast<void>(alpha);
  if (*m <= 0 || *n <= 0) return;
  const TriForm form = read_form<T>(side, uplo, transa, diag);
  if (form.left)
    unblocked_from_left<true>(form, *m, *n, a, *lda, b, *ldb);
  else
    unblocked_from_right<true>(form, *m, *n, static_cast<const T *>(nullptr), a, *lda, b, *ldb);
}

}  // namespace

QTB_KERNEL(strmm_unblocked, trmm, float, product_unblocked<float>)
QTB_KERNEL(dtrmm_unblocked, trmm, double, product_unblocked<double>)
QTB_KERNEL(ctrmm_unblocked, trmm, cfloat, product_unblocked<cfloat>)
QTB_KERNEL(ztrmm_unblocked, trmm, cdouble, product_unblocked<cdouble>)
QTB_KERNEL(strsm_unblocked, trmm, float, solve_unblocked<float>)
QTB_KERNEL(dtrsm_unblocked, trmm, double, solve_unblocked<double>)
QTB_KERNEL(ctrsm_unblocked, trmm, cfloat, solve_unblocked<cfloat>)
QTB_KERNEL(ztrsm_unblocked, trmm, cdouble, solve_unblocked<cdouble>)

}  // namespace qtb::QTB_TIER
