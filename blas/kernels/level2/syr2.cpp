// ssyr2, dsyr2, sspr2, dspr2: A := alpha*x*y^T + alpha*y*x^T + A on one triangle of A, full or packed; cher2, zher2,
// chpr2, zhpr2: A := alpha*x*y^H + conj(alpha)*y*x^H + A (syr2.h).
#include "blas/kernels/level2/syr2.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(syr2, T, syr2) {
  if (*n <= 0 || is_zero(*alpha)) return;
  update_full(*n, full_triangle(uplo, a, *lda, *n, 0), *alpha, From<T>(x, *n, *incx), From<T>(y, *n, *incy));
}
template <class T>
QTB_FUNCTION(spr2, T, spr2) {
  if (*n <= 0 || is_zero(*alpha)) return;
  update(*n, packed_triangle(uplo, ap, *n), *alpha, From<T>(x, *n, *incx), From<T>(y, *n, *incy));
}

}  // namespace

QTB_KERNEL(ssyr2, syr2, float, syr2<float>)
QTB_KERNEL(dsyr2, syr2, double, syr2<double>)
QTB_KERNEL(cher2, syr2, cfloat, syr2<cfloat>)
QTB_KERNEL(zher2, syr2, cdouble, syr2<cdouble>)
QTB_KERNEL(sspr2, spr2, float, spr2<float>)
QTB_KERNEL(dspr2, spr2, double, spr2<double>)
QTB_KERNEL(chpr2, spr2, cfloat, spr2<cfloat>)
QTB_KERNEL(zhpr2, spr2, cdouble, spr2<cdouble>)

}  // namespace qtb::QTB_TIER
