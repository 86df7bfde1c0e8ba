// ger, geru, gerc: A := alpha*x*y^T + A, or alpha*x*y^H + A.
//
// A column whose element of y is zero is skipped: it is not read, and a NaN in x does not reach it. x and y do not
// overlap A.
#include "blas/kernels/element.h"

namespace qtb::QTB_TIER {
namespace {

template <class T, bool conjugated = false>
QTB_FUNCTION(ger, T, ger) {
  if (*m <= 0 || *n <= 0 || is_zero(*alpha)) return;
  const Vector<const T> rows = vector(x, *m, *incx), columns = vector(y, *n, *incy);
  for (QtbInt j = 0; j < *n; j++) {
    if (is_zero(columns[j])) continue;
    const T factor = *alpha * conjugate_if<conjugated>(columns[j]);
    T *column = a + j * *lda;
    for (QtbInt i = 0; i < *m; i++) column[i] += rows[i] * factor;
  }
}

}  // namespace

QTB_KERNEL(sger, ger, float, ger<float>)
QTB_KERNEL(dger, ger, double, ger<double>)
QTB_KERNEL(cgeru, ger, cfloat, ger<cfloat>)
QTB_KERNEL(zgeru, ger, cdouble, ger<cdouble>)
QTB_KERNEL(cgerc, ger, cfloat, (ger<cfloat, true>))
QTB_KERNEL(zgerc, ger, cdouble, (ger<cdouble, true>))

}  // namespace qtb::QTB_TIER
