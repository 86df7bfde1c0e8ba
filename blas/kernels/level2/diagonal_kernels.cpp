// The diagonal kernels of TRSV and TRMV. Solves are substitutions by true divisions: a zero on the diagonal gives
// infinities or NaNs.
#include "blas/kernels/level2/diagonal_kernels.h"
#include "blas/kernels/level2/diagonal_blocks.h"

namespace qtb::QTB_TIER {
namespace {

template <class T, bool upper, Op op>
void product(bool unit, QtbInt n, const T *a, QtbInt lda, T *x, QtbInt incx) {
  if (unit)
    diagonal_block<largest_diagonal_product, TriangleCase<upper, op, true>, Product>(n, a, lda, x, incx);
  else
    diagonal_block<largest_diagonal_product, TriangleCase<upper, op, false>, Product>(n, a, lda, x, incx);
}
template <class T, Op op>
void product(bool upper, bool unit, QtbInt n, const T *a, QtbInt lda, T *x, QtbInt incx) {
  if (upper)
    product<T, true, op>(unit, n, a, lda, x, incx);
  else
    product<T, false, op>(unit, n, a, lda, x, incx);
}
template <class T>
QTB_FUNCTION(trmv, T, product) {
  const bool upper = is_letter(*uplo, 'U'), unit = is_letter(*diag, 'U');
  const Op op = read_op<T>(trans);
  if (op == Op::none) return product<T, Op::none>(upper, unit, *n, a, *lda, x, *incx);
  if constexpr (is_complex<T>)
    if (op == Op::conjugate) return product<T, Op::conjugate>(upper, unit, *n, a, *lda, x, *incx);
  product<T, Op::transpose>(upper, unit, *n, a, *lda, x, *incx);
}

}  // namespace

extern "C" {
#define QTB_DEFINE(T, prefix, name, upper, op, unit)                                                     \
  void QTB_TIER_NAME(prefix##trsv_diag_##name)(QTB_DIAGONAL_SOLVE_PARAMS(T)) {                           \
    diagonal_block<largest_diagonal_solve, TriangleCase<upper, op, unit>, Solve>(*n, a, *lda, x, *incx); \
  }
QTB_DIAGONAL_SOLVES(QTB_DEFINE)
#undef QTB_DEFINE

QTB_FUNCTION(trmv, float, QTB_TIER_NAME(strmv_diag)) { product<float>(QTB_ARGS_trmv); }
QTB_FUNCTION(trmv, double, QTB_TIER_NAME(dtrmv_diag)) { product<double>(QTB_ARGS_trmv); }
QTB_FUNCTION(trmv, cfloat, QTB_TIER_NAME(ctrmv_diag)) { product<cfloat>(QTB_ARGS_trmv); }
QTB_FUNCTION(trmv, cdouble, QTB_TIER_NAME(ztrmv_diag)) { product<cdouble>(QTB_ARGS_trmv); }
}

}  // namespace qtb::QTB_TIER
