// strmv_block, dtrmv_block, ctrmv_block, ztrmv_block: one thread's piece of trmv, of the tiers that have drivers.
//
// x := op(T)*x for some elements of x: what the triangle's rows or columns of the piece hold. Addresses, increments and
// method are those of triangle_product.h.
#include "blas/kernels/level2/triangle_product.h"

namespace qtb::QTB_TIER {
namespace {

// The piece's len elements of x are multiplied by their own triangle; then the rectangle beside that is added, whose
// elements of x stand outside the piece. work holds the old x from the first to the last element that the piece depends
// on, extent in all.
//
//   uplo, op      the piece's triangle             rectangle beside it              its elements of work
//   U N, L T/C    the first len of extent          the columns (rows) after it      from len
//   L N, U T/C    the last len of extent           the columns (rows) before it     from 0
template <class T>
QTB_FUNCTION(trmv_block, T, trmv_block) {
  if (*len <= 0) return;
  const T one = unit_element<T>();
  const QtbInt unit = 1, outside = *extent - *len;
  const bool by_columns = read_op<T>(trans) == Op::none, leads = is_letter(*uplo, 'U') == by_columns;
  const QtbInt along = by_columns ? *lda : 1;
  const T *const own = leads ? a : a + outside * along, *const beside = leads ? a + *len * along : a;
  const T *const own_old = leads ? work : work + outside, *const beside_old = leads ? work + *len : work;

  multiply_triangle(uplo, trans, diag, *len, own, *lda, walk_start(x, *len, *incx), *incx, own_old, unit);
  if (outside > 0)
    own_gemv(trans, by_columns ? len : &outside, by_columns ? &outside : len, &one, beside, lda, beside_old, &unit,
             &one, x, incx);
}

}  // namespace

QTB_KERNEL(strmv_block, trmv_block, float, trmv_block<float>)
QTB_KERNEL(dtrmv_block, trmv_block, double, trmv_block<double>)
QTB_KERNEL(ctrmv_block, trmv_block, cfloat, trmv_block<cfloat>)
QTB_KERNEL(ztrmv_block, trmv_block, cdouble, trmv_block<cdouble>)

}  // namespace qtb::QTB_TIER
