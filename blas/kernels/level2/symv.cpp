// ssymv, dsymv, chemv, zhemv: y := alpha*A*x + beta*y with a symmetric or Hermitian A, of which one triangle is read,
// once. sspmv, dspmv, chpmv, zhpmv: the same with a packed triangle; ssbmv, dsbmv, chbmv, zhbmv: with a band.
//
// Columns in groups of four; in pairs, where a real matrix is packed or a band; singly, where a complex one is a band.
// Any increments and addresses; x and y do not overlap.

#include "blas/kernels/level2/scale_y.h"
#include "blas/kernels/level2/symmetric_product.h"

namespace qtb::QTB_TIER {
namespace {

constexpr int full_group = 4;
template <class T>
constexpr int packed_group = is_complex<T> ? 4 : 2;
template <class T>
constexpr int band_group = is_complex<T> ? 1 : 2;

// y := beta*y, and then add(upper, vectors), with upper a constant, unless there is nothing to add.
template <class T, class Add>
[[gnu::always_inline]] inline void product(const char *uplo, QtbInt n, T alpha, const T *x, QtbInt incx, T beta, T *y,
                                           QtbInt incy, Add add) {
  if (n <= 0) return;
  scale_y(n, beta, y, incy);
  if (is_zero(alpha)) return;
  const Vectors<T> v{walk_start(x, n, incx), incx, walk_start(y, n, incy), incy};
  if (is_letter(*uplo, 'U'))
    add(Constant<true>(), v);
  else
    add(Constant<false>(), v);
}

template <class T>
QTB_FUNCTION(symv, T, symv) {
  product(uplo, *n, *alpha, x, *incx, *beta, y, *incy, [&](auto upper, const Vectors<T> &v) {
    add_triangle<upper.value, full_group>(*n, *alpha, full_columns(a, *lda), v);
  });
}

template <class T>
QTB_FUNCTION(spmv, T, spmv) {
  product(uplo, *n, *alpha, x, *incx, *beta, y, *incy, [&](auto upper, const Vectors<T> &v) {
    add_triangle<upper.value, packed_group<T>>(*n, *alpha, packed_columns<upper.value>(ap, *n), v);
  });
}

template <class T>
QTB_FUNCTION(sbmv, T, sbmv) {
  product(uplo, *n, *alpha, x, *incx, *beta, y, *incy, [&](auto upper, const Vectors<T> &v) {
    add_band<upper.value, band_group<T>>(*n, *k, *alpha, band_columns<upper.value>(a, *lda, *k), v);
  });
}

}  // namespace

QTB_KERNEL(ssymv, symv, float, symv<float>)
QTB_KERNEL(dsymv, symv, double, symv<double>)
QTB_KERNEL(chemv, symv, cfloat, symv<cfloat>)
QTB_KERNEL(zhemv, symv, cdouble, symv<cdouble>)
QTB_KERNEL(sspmv, spmv, float, spmv<float>)
QTB_KERNEL(dspmv, spmv, double, spmv<double>)
QTB_KERNEL(chpmv, spmv, cfloat, spmv<cfloat>)
QTB_KERNEL(zhpmv, spmv, cdouble, spmv<cdouble>)
QTB_KERNEL(ssbmv, sbmv, float, sbmv<float>)
QTB_KERNEL(dsbmv, sbmv, double, sbmv<double>)
QTB_KERNEL(chbmv, sbmv, cfloat, sbmv<cfloat>)
QTB_KERNEL(zhbmv, sbmv, cdouble, sbmv<cdouble>)

}  // namespace qtb::QTB_TIER
