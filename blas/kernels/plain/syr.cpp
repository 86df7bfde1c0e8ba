// syr, spr: A := alpha*x*x^T + A on one triangle, full or packed; her, hpr: A := alpha*x*x^H + A with a real alpha.
// syr_block: the same on some columns of a triangle with a rectangle beside it.
//
// A column whose element of x is zero is skipped, but for the imaginary part of its diagonal, which an update of a
// Hermitian matrix always sets to zero. x does not overlap A.
#include "blas/kernels/plain/storage.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
void rank_one_update(Triangle<T> a, Real<T> alpha, const T *x, QtbInt incx) {
  if (a.columns <= 0 || is_zero(alpha)) return;
  const Vector<const T> from = vector(x, a.n, incx);
  for (QtbInt j = a.first; j < a.first + a.columns; j++) {
    T *column = a.column(j);
    if (is_zero(from[j])) {
      if constexpr (is_complex<T>) column[j].im = 0;
      continue;
    }
    const T factor = alpha * conjugate(from[j]);
    for (QtbInt i = a.off_begin(j); i < a.off_end(j); i++) column[i] += from[i] * factor;
    column[j] = real_only(column[j]) + real_only(from[j] * factor);
  }
}

template <class T>
QTB_FUNCTION(her, T, update_full) {
  rank_one_update(triangle(uplo, a, *lda, *n), *alpha, x, *incx);
}

template <class T>
QTB_FUNCTION(hpr, T, update_packed) {
  rank_one_update(triangle_packed(uplo, ap, *n), *alpha, x, *incx);
}

#if QTB_TIER_AT_LEAST(ssse3)
template <class T>
QTB_FUNCTION(syr_block, T, update_piece) {
  rank_one_update(triangle_piece(uplo, a, *lda, *len, *other), *alpha, x, *incx);
}
#endif

}  // namespace

QTB_KERNEL(ssyr, syr, float, update_full<float>)
QTB_KERNEL(dsyr, syr, double, update_full<double>)
QTB_KERNEL(cher, her, cfloat, update_full<cfloat>)
QTB_KERNEL(zher, her, cdouble, update_full<cdouble>)
QTB_KERNEL(sspr, spr, float, update_packed<float>)
QTB_KERNEL(dspr, spr, double, update_packed<double>)
QTB_KERNEL(chpr, hpr, cfloat, update_packed<cfloat>)
QTB_KERNEL(zhpr, hpr, cdouble, update_packed<cdouble>)
#if QTB_TIER_AT_LEAST(ssse3)
QTB_KERNEL(ssyr_block, syr_block, float, update_piece<float>)
QTB_KERNEL(dsyr_block, syr_block, double, update_piece<double>)
#endif

}  // namespace qtb::QTB_TIER
