// symv, sbmv, spmv: y := alpha*A*x + beta*y with a symmetric A, full, band or packed; hemv, hbmv, hpmv with a
// Hermitian.
//
// One triangle is read, once: a stored element serves its own row and its mirror image's. The diagonal of a Hermitian
// matrix counts by its real part. x and y do not overlap.
#include "blas/kernels/plain/storage.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
void symmetric_product(Triangle<const T> a, T alpha, const T *x, QtbInt incx, T beta, T *y, QtbInt incy) {
  if (a.n <= 0) return;
  const Vector<const T> from = vector(x, a.n, incx);
  const Vector<T> to = vector(y, a.n, incy);
  scale(a.n, beta, to);
  if (is_zero(alpha)) return;
  for (QtbInt j = 0; j < a.n; j++) {
    const T *column = a.column(j);
    const T factor = alpha * from[j];
    T mirrored{};
    for (QtbInt i = a.off_begin(j); i < a.off_end(j); i++) {
      to[i] += factor * column[i];
      mirrored += conjugate(column[i]) * from[i];
    }
    to[j] += real_part(column[j]) * factor + alpha * mirrored;
  }
}

template <class T>
QTB_FUNCTION(symv, T, symv) {
  symmetric_product(triangle(uplo, a, *lda, *n), *alpha, x, *incx, *beta, y, *incy);
}

template <class T>
QTB_FUNCTION(sbmv, T, sbmv) {
  symmetric_product(triangle_band(uplo, a, *lda, *n, *k), *alpha, x, *incx, *beta, y, *incy);
}

template <class T>
QTB_FUNCTION(spmv, T, spmv) {
  symmetric_product(triangle_packed(uplo, ap, *n), *alpha, x, *incx, *beta, y, *incy);
}

}  // namespace

QTB_KERNEL(ssymv, symv, float, symv<float>)
QTB_KERNEL(dsymv, symv, double, symv<double>)
QTB_KERNEL(chemv, symv, cfloat, symv<cfloat>)
QTB_KERNEL(zhemv, symv, cdouble, symv<cdouble>)
QTB_KERNEL(ssbmv, sbmv, float, sbmv<float>)
QTB_KERNEL(dsbmv, sbmv, double, sbmv<double>)
QTB_KERNEL(chbmv, sbmv, cfloat, sbmv<cfloat>)
QTB_KERNEL(zhbmv, sbmv, cdouble, sbmv<cdouble>)
QTB_KERNEL(sspmv, spmv, float, spmv<float>)
QTB_KERNEL(dspmv, spmv, double, spmv<double>)
QTB_KERNEL(chpmv, spmv, cfloat, spmv<cfloat>)
QTB_KERNEL(zhpmv, spmv, cdouble, spmv<cdouble>)

}  // namespace qtb::QTB_TIER
