// trmm: B := alpha*op(T)*B (side "L") or alpha*B*op(T) ("R"), in place.
//
// From the left every column of B is a triangular product of its own; from the right the columns of B take the place of
// a vector's elements. With an alpha of 0 B is zeroed and neither T nor B is read. T does not overlap B.
#include "blas/kernels/plain/product.h"
#include "blas/kernels/plain/triangular.h"

namespace qtb::QTB_TIER {
namespace {

// B := B*op(T). With N column j of B is gathered from the others, with T and C it is scattered over them.
template <class T>
void product_from_right(Triangle<const T> t, Op op, bool unit, QtbInt m, T *b, QtbInt ldb) {
  const bool gathered = op == Op::none;
  for (QtbInt s = 0; s < t.n; s++) {
    const QtbInt j = t.upper == gathered ? t.n - 1 - s : s;
    const T *column = t.column(j);
    T *own = b + j * ldb;
    if (gathered && !unit)
      for (QtbInt r = 0; r < m; r++) own[r] = column[j] * own[r];
    for (QtbInt i = t.off_begin(j); i < t.off_end(j); i++) {
      const T factor = op == Op::conjugate ? conjugate(column[i]) : column[i];
      T *other = b + i * ldb;
      if (gathered)
        for (QtbInt r = 0; r < m; r++) own[r] += factor * other[r];
      else
        for (QtbInt r = 0; r < m; r++) other[r] += factor * own[r];
    }
    if (!gathered && !unit) {
      const T factor = op == Op::conjugate ? conjugate(column[j]) : column[j];
      for (QtbInt r = 0; r < m; r++) own[r] = factor * own[r];
    }
  }
}

template <class T>
QTB_FUNCTION(trmm, T, trmm) {
  if (*m <= 0 || *n <= 0) return;
  scale_part(Part::whole, *m, *n, *alpha, b, *ldb);
  if (is_zero(*alpha)) return;
  const bool left = is_letter(*side, 'L'), unit = is_letter(*diag, 'U');
  const Triangle<const T> t = triangle(uplo, a, *lda, left ? *m : *n);
  if (left)
    for (QtbInt j = 0; j < *n; j++) triangular_product(t, read_op<T>(transa), unit, b + j * *ldb);
  else
    product_from_right(t, read_op<T>(transa), unit, *m, b, *ldb);
}

}  // namespace

QTB_KERNEL(strmm, trmm, float, trmm<float>)
QTB_KERNEL(dtrmm, trmm, double, trmm<double>)
QTB_KERNEL(ctrmm, trmm, cfloat, trmm<cfloat>)
QTB_KERNEL(ztrmm, trmm, cdouble, trmm<cdouble>)

}  // namespace qtb::QTB_TIER
