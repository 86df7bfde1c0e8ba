// tbsv, tpsv: x := op(T)^-1*x, in place, for a band or packed triangle.
//
// By substitution with true divisions; a zero on the diagonal gives infinities or NaNs.
#include "blas/kernels/plain/triangular.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(tbmv, T, tbsv) {
  triangular_solve(triangle_band(uplo, a, *lda, *n, *k), read_op<T>(trans), is_letter(*diag, 'U'),
                   vector(x, *n, *incx));
}

template <class T>
QTB_FUNCTION(tpmv, T, tpsv) {
  triangular_solve(triangle_packed(uplo, ap, *n), read_op<T>(trans), is_letter(*diag, 'U'), vector(x, *n, *incx));
}

}  // namespace

QTB_KERNEL(stbsv, tbmv, float, tbsv<float>)
QTB_KERNEL(dtbsv, tbmv, double, tbsv<double>)
QTB_KERNEL(ctbsv, tbmv, cfloat, tbsv<cfloat>)
QTB_KERNEL(ztbsv, tbmv, cdouble, tbsv<cdouble>)
QTB_KERNEL(stpsv, tpmv, float, tpsv<float>)
QTB_KERNEL(dtpsv, tpmv, double, tpsv<double>)
QTB_KERNEL(ctpsv, tpmv, cfloat, tpsv<cfloat>)
QTB_KERNEL(ztpsv, tpmv, cdouble, tpsv<cdouble>)

}  // namespace qtb::QTB_TIER
