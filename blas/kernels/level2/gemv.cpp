// sgemv, dgemv, cgemv, zgemv: y := alpha*op(A)*x + beta*y for a full m x n matrix.
//
// Any address; increments of either sign; x and y do not overlap. Nothing is read of A and x for an alpha of zero, and
// nothing of y for a beta of zero. sgemv, and all of the tier def, work straight on the operands; the other types have
// inner kernels from sse3 on.
#include "blas/kernels/level2/gemv_direct.h"
#include "blas/kernels/level2/gemv_tiles.h"
#include "blas/kernels/level2/scale_y.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(gemv, T, gemv) {
  if (*m <= 0 || *n <= 0 || (is_zero(*alpha) && is_one(*beta))) return;
  const Op op = read_op<T>(trans);
  const QtbInt lenx = op == Op::none ? *n : *m, leny = op == Op::none ? *m : *n;
  scale_y(leny, *beta, y, *incy);
  if (is_zero(*alpha)) return;
  x = walk_start(x, lenx, *incx);
  y = walk_start(y, leny, *incy);
  if constexpr (this_tier >= tier_sse3 && sizeof(T) != sizeof(float)) {
    if (*incx == 1 && *incy == 1 && on_8_bytes(a, x, y)) return gemv_kernel<T>(op, *lda)(m, n, alpha, a, lda, x, y);
    tiled_product<T>({op, *m, *n, *alpha, a, *lda, x, *incx, y, *incy});
  } else {
    direct_product<T>(op, {*m, *n, *alpha, a, *lda, x, *incx, y, *incy});
  }
}

}  // namespace

QTB_KERNEL(sgemv, gemv, float, gemv<float>)
QTB_KERNEL(dgemv, gemv, double, gemv<double>)
QTB_KERNEL(cgemv, gemv, cfloat, gemv<cfloat>)
QTB_KERNEL(zgemv, gemv, cdouble, gemv<cdouble>)

}  // namespace qtb::QTB_TIER
