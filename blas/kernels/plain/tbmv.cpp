// tbmv, tpmv: x := op(T)*x, in place, for a band or packed triangle.
#include "blas/kernels/plain/triangular.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(tbmv, T, tbmv) {
  triangular_product(triangle_band(uplo, a, *lda, *n, *k), read_op<T>(trans), is_letter(*diag, 'U'),
                     vector(x, *n, *incx));
}

template <class T>
QTB_FUNCTION(tpmv, T, tpmv) {
  triangular_product(triangle_packed(uplo, ap, *n), read_op<T>(trans), is_letter(*diag, 'U'), vector(x, *n, *incx));
}

}  // namespace

QTB_KERNEL(stbmv, tbmv, float, tbmv<float>)
QTB_KERNEL(dtbmv, tbmv, double, tbmv<double>)
QTB_KERNEL(ctbmv, tbmv, cfloat, tbmv<cfloat>)
QTB_KERNEL(ztbmv, tbmv, cdouble, tbmv<cdouble>)
QTB_KERNEL(stpmv, tpmv, float, tpmv<float>)
QTB_KERNEL(dtpmv, tpmv, double, tpmv<double>)
QTB_KERNEL(ctpmv, tpmv, cfloat, tpmv<cfloat>)
QTB_KERNEL(ztpmv, tpmv, cdouble, tpmv<cdouble>)

}  // namespace qtb::QTB_TIER
