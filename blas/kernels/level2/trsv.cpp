// strsv, dtrsv, ctrsv, ztrsv: x := op(T)^-1*x, in place, for a full triangle of order n.
//
// Any address, increments of either sign. Blocks of 32 from the end at which the solve starts, the remainder last: a
// kernel solves the block on the diagonal, and products with the rectangle beside it do the rest. Those go through the
// front end of GEMV, so that large ones run on several threads. Neither a singular triangle nor a unit diagonal is
// looked at.
#include "blas/kernels/level2/diagonal_kernels.h"
#include "blas/kernels/level2/triangle_walk.h"
#include "blas/thread/drivers.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt block_size = largest_diagonal_solve;

inline void front_end_gemv(QTB_PARAMS_gemv(float)) { qtb_blas_sgemv(QTB_ARGS_gemv); }
inline void front_end_gemv(QTB_PARAMS_gemv(double)) { qtb_blas_dgemv(QTB_ARGS_gemv); }
inline void front_end_gemv(QTB_PARAMS_gemv(cfloat)) { qtb_blas_cgemv(QTB_ARGS_gemv); }
inline void front_end_gemv(QTB_PARAMS_gemv(cdouble)) { qtb_blas_zgemv(QTB_ARGS_gemv); }

template <class T>
QTB_FUNCTION(trmv, T, trsv) {
  const T one = unit_element<T>(), minus_one = -one;
  const bool upper = is_letter(*uplo, 'U');
  const Op op = read_op<T>(trans);
  const bool transposed = op != Op::none;
  DiagonalSolve<T> *const solve = diagonal_solve<T>(upper, op, is_letter(*diag, 'U'));
  T *const first_x = walk_start(x, *n, *incx);

  walk_blocks(*n, block_size, upper == transposed, [&](QtbInt first, QtbInt length) {
    T *const block = first_x + first * *incx;
    const T *const columns = a + first * *lda;
    // The rows beside the block: solved ones if transposed, unsolved ones if not.
    const QtbInt beside = upper ? 0 : first + length, rows = upper ? first : *n - beside;
    T *const x_beside = vector_argument(first_x + beside * *incx, rows, *incx);
    T *const x_block = vector_argument(block, length, *incx);
    if (transposed && rows > 0)
      front_end_gemv(trans, &rows, &length, &minus_one, columns + beside, lda, x_beside, incx, &one, x_block, incx);
    solve(&length, columns + first, lda, block, incx);
    if (!transposed && rows > 0)
      front_end_gemv(trans, &rows, &length, &minus_one, columns + beside, lda, x_block, incx, &one, x_beside, incx);
  });
}

}  // namespace

QTB_KERNEL(strsv, trmv, float, trsv<float>)
QTB_KERNEL(dtrsv, trmv, double, trsv<double>)
QTB_KERNEL(ctrsv, trmv, cfloat, trsv<cfloat>)
QTB_KERNEL(ztrsv, trmv, cdouble, trsv<cdouble>)

}  // namespace qtb::QTB_TIER
