// strmv, dtrmv, ctrmv, ztrmv: x := op(T)*x, in place, for a full triangle of order n; and the block routines, which do
// one thread's piece of it in the tiers that have drivers.
//
// Any address, increments of either sign. Blocks of 64: a kernel multiplies the block on the diagonal, and this tier's
// GEMV adds the rectangle beside it, in the order in which x is read before it is overwritten. A unit diagonal is not
// read.
#include "blas/kernels/level2/diagonal_kernels.h"
#include "blas/kernels/level2/triangle_walk.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt block_size = largest_diagonal_product;

// ---- This tier's procedures by type ----

inline void own_gemv(QTB_PARAMS_gemv(float)) { QTB_TIER_NAME(xsgemv)(QTB_ARGS_gemv); }
inline void own_gemv(QTB_PARAMS_gemv(double)) { QTB_TIER_NAME(xdgemv)(QTB_ARGS_gemv); }
inline void own_gemv(QTB_PARAMS_gemv(cfloat)) { QTB_TIER_NAME(xcgemv)(QTB_ARGS_gemv); }
inline void own_gemv(QTB_PARAMS_gemv(cdouble)) { QTB_TIER_NAME(xzgemv)(QTB_ARGS_gemv); }
inline void multiply_block(QTB_PARAMS_trmv(float)) { QTB_TIER_NAME(strmv_diag)(QTB_ARGS_trmv); }
inline void multiply_block(QTB_PARAMS_trmv(double)) { QTB_TIER_NAME(dtrmv_diag)(QTB_ARGS_trmv); }
inline void multiply_block(QTB_PARAMS_trmv(cfloat)) { QTB_TIER_NAME(ctrmv_diag)(QTB_ARGS_trmv); }
inline void multiply_block(QTB_PARAMS_trmv(cdouble)) { QTB_TIER_NAME(ztrmv_diag)(QTB_ARGS_trmv); }

// ---- The whole triangle ----

// first_x is the first element of x. old has the elements of x as they were, from old's first element on; it may be x
// itself, since what is read of it has not been overwritten yet.
template <class T>
void multiply_triangle(const char *uplo, const char *trans, const char *diag, QtbInt n, const T *a, QtbInt lda,
                       T *first_x, QtbInt incx, const T *old, QtbInt inc_old) {
  const T one = unit_element<T>();
  const bool upper = is_letter(*uplo, 'U'), transposed = read_op<T>(trans) != Op::none;
  walk_blocks(n, block_size, upper != transposed, [&](QtbInt first, QtbInt length) {
    const T *const columns = a + first * lda;
    const QtbInt beside = upper ? 0 : first + length, rows = upper ? first : n - beside;
    const auto old_from = [&](QtbInt i, QtbInt count) { return vector_argument(old + i * inc_old, count, inc_old); };
    const auto x_from = [&](QtbInt i, QtbInt count) { return vector_argument(first_x + i * incx, count, incx); };
    if (!transposed && rows > 0)
      own_gemv(trans, &rows, &length, &one, columns + beside, &lda, old_from(first, length), &inc_old, &one,
               x_from(beside, rows), &incx);
    multiply_block(uplo, trans, diag, &length, columns + first, &lda, first_x + first * incx, &incx);
    if (transposed && rows > 0)
      own_gemv(trans, &rows, &length, &one, columns + beside, &lda, old_from(beside, rows), &inc_old, &one,
               x_from(first, length), &incx);
  });
}

template <class T>
QTB_FUNCTION(trmv, T, trmv) {
  T *const first_x = walk_start(x, *n, *incx);
  multiply_triangle(uplo, trans, diag, *n, a, *lda, first_x, *incx, first_x, *incx);
}

// ---- A piece ----

#if QTB_TIER_AT_LEAST(ssse3)
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
#endif

}  // namespace

QTB_KERNEL(strmv, trmv, float, trmv<float>)
QTB_KERNEL(dtrmv, trmv, double, trmv<double>)
QTB_KERNEL(ctrmv, trmv, cfloat, trmv<cfloat>)
QTB_KERNEL(ztrmv, trmv, cdouble, trmv<cdouble>)
#if QTB_TIER_AT_LEAST(ssse3)
QTB_KERNEL(strmv_block, trmv_block, float, trmv_block<float>)
QTB_KERNEL(dtrmv_block, trmv_block, double, trmv_block<double>)
QTB_KERNEL(ctrmv_block, trmv_block, cfloat, trmv_block<cfloat>)
QTB_KERNEL(ztrmv_block, trmv_block, cdouble, trmv_block<cdouble>)
#endif

}  // namespace qtb::QTB_TIER
