// Triangular products and solves from the right with a triangle of 1 to 8 columns (small_right.h).
//
// The triangle becomes a table of vectors, and the rows of B pass by it a vector or two at a time, with all their
// columns in registers: straight-line code for each n. The form of the triangle is a matter of the order and the
// strides in which the table is filled and B walked, so that the forms of a type share this code.
#include "blas/kernels/level3/triangular/small_right.h"

#include "blas/kernels/level3/triangular/right_columns.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
using ScalProcedure = QTB_FUNCTION_TYPE(scal, T);
template <class T>
constexpr ScalProcedure<T> *scal_slot = nullptr;
#define QTB_NAME_SCAL(t, T) \
  template <>               \
  constexpr ScalProcedure<T> *scal_slot<T> = QTB_TIER_NAME(x##t##scal);
QTB_PARTS(QTB_NAME_SCAL)
#undef QTB_NAME_SCAL

// Vectors of rows at a time: with few columns two, so that one need not wait for the other.
template <class T>
constexpr int vectors_beside(int n) {
  constexpr int registers = is_complex<T> ? 4 : 8;
  return 2 * n <= registers ? 2 : 1;
}

template <bool solves, int n, class T>
void take_columns(const TriForm &form, QtbInt m, const T *alpha, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  const RightTriangle<T> triangle(form, n, a, lda, b, ldb);
  right_columns<solves, n, vectors_beside<T>(n), false>(triangle, form.unit, m, 0, alpha);
}

template <bool solves, class T>
void small_right(const TriForm &form, QtbInt m, QtbInt n, const T *alpha, const T *a, QtbInt lda, T *b, QtbInt ldb) {
  switch (n) {
    case 1: return take_columns<solves, 1>(form, m, alpha, a, lda, b, ldb);
    case 2: return take_columns<solves, 2>(form, m, alpha, a, lda, b, ldb);
    case 3: return take_columns<solves, 3>(form, m, alpha, a, lda, b, ldb);
    case 4: return take_columns<solves, 4>(form, m, alpha, a, lda, b, ldb);
    case 5: return take_columns<solves, 5>(form, m, alpha, a, lda, b, ldb);
    case 6: return take_columns<solves, 6>(form, m, alpha, a, lda, b, ldb);
    case 7: return take_columns<solves, 7>(form, m, alpha, a, lda, b, ldb);
    default: return take_columns<solves, 8>(form, m, alpha, a, lda, b, ldb);
  }
}

template <class T>
QTB_FUNCTION(trmm, T, product_small_right) {
  static_cast<void>(side);
  if (*m <= 0 || *n <= 0) return;
  const TriForm form = read_form<T>("R", uplo, transa, diag);
  if (*n > 1) return small_right<false>(form, *m, *n, is_one(*alpha) ? nullptr : alpha, a, *lda, b, *ldb);
  // One column is multiplied by one number. Without a diagonal and with an alpha of 1 nothing is touched.
  T factor = *alpha;
  if (!form.unit) {
    const T element = read_element(ByElement<T>{a, 1, 1, form.op == Op::conjugate}, 0, 0);
    factor = is_one(factor) ? element : factor * element;
  }
  if (is_one(factor)) return;
  const QtbInt one = 1;
  scal_slot<T>(m, &factor, b, &one);
}

template <class T>
QTB_FUNCTION(trmm, T, solve_small_right) {
  static_cast<void>(side), static_cast<void>(alpha);
  if (*m <= 0 || *n <= 0) return;
  small_right<true>(read_form<T>("R", uplo, transa, diag), *m, *n, static_cast<const T *>(nullptr), a, *lda, b, *ldb);
}

}  // namespace

QTB_KERNEL(strmm_small_right, trmm, float, product_small_right<float>)
QTB_KERNEL(dtrmm_small_right, trmm, double, product_small_right<double>)
QTB_KERNEL(ctrmm_small_right, trmm, cfloat, product_small_right<cfloat>)
QTB_KERNEL(ztrmm_small_right, trmm, cdouble, product_small_right<cdouble>)
QTB_KERNEL(strsm_small_right, trmm, float, solve_small_right<float>)
QTB_KERNEL(dtrsm_small_right, trmm, double, solve_small_right<double>)
QTB_KERNEL(ctrsm_small_right, trmm, cfloat, solve_small_right<cfloat>)
QTB_KERNEL(ztrsm_small_right, trmm, cdouble, solve_small_right<cdouble>)

}  // namespace qtb::QTB_TIER
