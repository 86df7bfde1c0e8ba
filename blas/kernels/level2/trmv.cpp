// strmv, dtrmv, ctrmv, ztrmv: x := op(T)*x, in place, for a full triangle of order n (triangle_product.h).
#include "blas/kernels/level2/triangle_product.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(trmv, T, trmv) {
  T *const first_x = walk_start(x, *n, *incx);
  multiply_triangle(uplo, trans, diag, *n, a, *lda, first_x, *incx, first_x, *incx);
}

}  // namespace

QTB_KERNEL(strmv, trmv, float, trmv<float>)
QTB_KERNEL(dtrmv, trmv, double, trmv<double>)
QTB_KERNEL(ctrmv, trmv, cfloat, trmv<cfloat>)
QTB_KERNEL(ztrmv, trmv, cdouble, trmv<cdouble>)

}  // namespace qtb::QTB_TIER
