// ssyr_block, dsyr_block: A := alpha*x*x^T + A on some columns of a triangle together with the rectangle of rows above
// or below them, for the parallel drivers (syr.h).
#include "blas/kernels/level2/syr.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(syr_block, T, syr_block) {
  if (*len <= 0 || is_zero(*alpha)) return;
  update(*len, full_triangle(uplo, a, *lda, *len, *other), *alpha, From<T>(x, *len + *other, *incx));
}

}  // namespace

QTB_KERNEL(ssyr_block, syr_block, float, syr_block<float>)
QTB_KERNEL(dsyr_block, syr_block, double, syr_block<double>)

}  // namespace qtb::QTB_TIER
