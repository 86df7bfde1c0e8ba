// trmv: x := op(T)*x, in place, for a full triangle. trmv_block: one piece of it.
#include "blas/kernels/plain/triangular.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(trmv, T, trmv) {
  triangular_product(triangle(uplo, a, *lda, *n), read_op<T>(trans), is_letter(*diag, 'U'), vector(x, *n, *incx));
}

#if QTB_TIER_AT_LEAST(ssse3)
// The piece's own triangle is multiplied in place; what lies beside it takes the elements outside the piece from work,
// which holds the old x from the first to the last element that the piece depends on.
//
//   uplo, op      triangle of the piece            rectangle beside it              its elements of work
//   U N, L T/C    the first len of extent          the columns (rows) after it      from len
//   L N, U T/C    the last len of extent           the columns (rows) before it     from 0
template <class T>
QTB_FUNCTION(trmv_block, T, trmv_block) {
  if (*len <= 0) return;
  const Op op = read_op<T>(trans);
  const bool by_columns = op == Op::none, leads = is_letter(*uplo, 'U') == by_columns;
  const QtbInt along = by_columns ? *lda : 1, outside = *extent - *len;
  const T *own = leads ? a : a + outside * along, *beside = leads ? a + *len * along : a;
  const T *old = leads ? work + *len : work;
  const Vector<T> piece = vector(x, *len, *incx);

  triangular_product(triangle(uplo, own, *lda, *len), op, is_letter(*diag, 'U'), piece);
  if (by_columns) {
    for (QtbInt j = 0; j < outside; j++)
      for (QtbInt i = 0; i < *len; i++) piece[i] += old[j] * beside[i + j * *lda];
  } else {
    for (QtbInt i = 0; i < *len; i++) {
      const T *column = beside + i * *lda;
      T sum{};
      for (QtbInt j = 0; j < outside; j++) sum += (op == Op::conjugate ? conjugate(column[j]) : column[j]) * old[j];
      piece[i] += sum;
    }
  }
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
