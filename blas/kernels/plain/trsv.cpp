// trsv: x := op(T)^-1*x, in place, for a full triangle.
//
// By substitution with true divisions; a zero on the diagonal gives infinities or NaNs.
#include "blas/kernels/plain/triangular.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(trmv, T, trsv) {
  triangular_solve(triangle(uplo, a, *lda, *n), read_op<T>(trans), is_letter(*diag, 'U'), vector(x, *n, *incx));
}

}  // namespace

QTB_KERNEL(strsv, trmv, float, trsv<float>)
QTB_KERNEL(dtrsv, trmv, double, trsv<double>)
QTB_KERNEL(ctrsv, trmv, cfloat, trsv<cfloat>)
QTB_KERNEL(ztrsv, trmv, cdouble, trsv<cdouble>)

}  // namespace qtb::QTB_TIER
