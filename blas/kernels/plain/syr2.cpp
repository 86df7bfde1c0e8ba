// syr2, spr2: A := alpha*x*y^T + alpha*y*x^T + A on one triangle, full or packed; her2, hpr2:
// A := alpha*x*y^H + conj(alpha)*y*x^H + A. syr2_block: the same on some columns of a triangle with a rectangle beside
// it.
//
// A column whose elements of x and y are both zero is skipped, but for the imaginary part of its diagonal, which an
// update of a Hermitian matrix always sets to zero. x and y do not overlap A.
#include "blas/kernels/plain/storage.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
void rank_two_update(Triangle<T> a, T alpha, const T *x, QtbInt incx, const T *y, QtbInt incy) {
  if (a.columns <= 0 || is_zero(alpha)) return;
  const Vector<const T> xs = vector(x, a.n, incx), ys = vector(y, a.n, incy);
  for (QtbInt j = a.first; j < a.first + a.columns; j++) {
    T *column = a.column(j);
    if (is_zero(xs[j]) && is_zero(ys[j])) {
      if constexpr (is_complex<T>) column[j].im = 0;
      continue;
    }
    const T of_x = alpha * conjugate(ys[j]), of_y = conjugate(alpha * xs[j]);
    for (QtbInt i = a.off_begin(j); i < a.off_end(j); i++) column[i] += xs[i] * of_x + ys[i] * of_y;
    column[j] = real_only(column[j]) + real_only(xs[j] * of_x + ys[j] * of_y);
  }
}

template <class T>
QTB_FUNCTION(syr2, T, update_full) {
  rank_two_update(triangle(uplo, a, *lda, *n), *alpha, x, *incx, y, *incy);
}

template <class T>
QTB_FUNCTION(spr2, T, update_packed) {
  rank_two_update(triangle_packed(uplo, ap, *n), *alpha, x, *incx, y, *incy);
}

#if QTB_TIER_AT_LEAST(ssse3)
template <class T>
QTB_FUNCTION(syr2_block, T, update_piece) {
  rank_two_update(triangle_piece(uplo, a, *lda, *len, *other), *alpha, x, *incx, y, *incy);
}
#endif

}  // namespace

QTB_KERNEL(ssyr2, syr2, float, update_full<float>)
QTB_KERNEL(dsyr2, syr2, double, update_full<double>)
QTB_KERNEL(cher2, syr2, cfloat, update_full<cfloat>)
QTB_KERNEL(zher2, syr2, cdouble, update_full<cdouble>)
QTB_KERNEL(sspr2, spr2, float, update_packed<float>)
QTB_KERNEL(dspr2, spr2, double, update_packed<double>)
QTB_KERNEL(chpr2, spr2, cfloat, update_packed<cfloat>)
QTB_KERNEL(zhpr2, spr2, cdouble, update_packed<cdouble>)
#if QTB_TIER_AT_LEAST(ssse3)
QTB_KERNEL(ssyr2_block, syr2_block, float, update_piece<float>)
QTB_KERNEL(dsyr2_block, syr2_block, double, update_piece<double>)
#endif

}  // namespace qtb::QTB_TIER
