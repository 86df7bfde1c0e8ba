// gemv: y := alpha*op(A)*x + beta*y for a general matrix.
//
// Column by column: an update of y with N, a dot product with T and C. x and y do not overlap.
#include "blas/kernels/plain/storage.h"

namespace qtb::QTB_TIER {
namespace {

template <bool conjugated, class T>
void add_dots(General<const T> a, QtbInt n, T alpha, Vector<const T> x, Vector<T> y) {
  for (QtbInt j = 0; j < n; j++) {
    const T *column = a.column(j);
    T sum{};
    for (QtbInt i = a.begin(j); i < a.end(j); i++) sum += conjugate_if<conjugated>(column[i]) * x[i];
    y[j] += alpha * sum;
  }
}

template <class T>
void general_product(General<const T> a, Op op, QtbInt m, QtbInt n, T alpha, const T *x, QtbInt incx, T beta, T *y,
                     QtbInt incy) {
  if (m <= 0 || n <= 0) return;
  const bool transposed = op != Op::none;
  const Vector<const T> from = vector(x, transposed ? m : n, incx);
  const Vector<T> to = vector(y, transposed ? n : m, incy);
  scale(transposed ? n : m, beta, to);
  if (is_zero(alpha)) return;
  if (op == Op::none) {
    for (QtbInt j = 0; j < n; j++) {
      const T factor = alpha * from[j];
      const T *column = a.column(j);
      for (QtbInt i = a.begin(j); i < a.end(j); i++) to[i] += factor * column[i];
    }
  } else if (op == Op::transpose) {
    add_dots<false>(a, n, alpha, from, to);
  } else {
    add_dots<true>(a, n, alpha, from, to);
  }
}

template <class T>
QTB_FUNCTION(gemv, T, gemv) {
  general_product(general(a, *lda, *m, *n), read_op<T>(trans), *m, *n, *alpha, x, *incx, *beta, y, *incy);
}

}  // namespace

QTB_KERNEL(sgemv, gemv, float, gemv<float>)
QTB_KERNEL(dgemv, gemv, double, gemv<double>)
QTB_KERNEL(cgemv, gemv, cfloat, gemv<cfloat>)
QTB_KERNEL(zgemv, gemv, cdouble, gemv<cdouble>)

}  // namespace qtb::QTB_TIER
