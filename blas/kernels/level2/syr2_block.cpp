// ssyr2_block, dsyr2_block: A := alpha*x*y^T + alpha*y*x^T + A on some columns of a triangle together with the
// rectangle of rows above or below them, for the parallel drivers (syr2.h).
#include "blas/kernels/level2/syr2.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(syr2_block, T, syr2_block) {
  if (*len <= 0 || is_zero(*alpha)) return;
  const QtbInt n = *len + *other;
  update_full(*len, full_triangle(uplo, a, *lda, *len, *other), *alpha, From<T>(x, n, *incx), From<T>(y, n, *incy));
}

}  // namespace

QTB_KERNEL(ssyr2_block, syr2_block, float, syr2_block<float>)
QTB_KERNEL(dsyr2_block, syr2_block, double, syr2_block<double>)

}  // namespace qtb::QTB_TIER
