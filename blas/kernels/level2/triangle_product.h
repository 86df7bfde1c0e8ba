// x := op(T)*x, in place, for a full triangle of order n: trmv and its pieces.
//
// Any address, increments of either sign. Blocks of 64: a kernel multiplies the block on the diagonal, and this tier's
// GEMV adds the rectangle beside it, in the order in which x is read before it is overwritten. A unit diagonal is not
// read.
#pragma once

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

}  // namespace
}  // namespace qtb::QTB_TIER
