// sgemm, dgemm, cgemm, zgemm of the tiers with one family for each type.
#include "blas/kernels/level3/gemm/body.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(sgemm, gemm, float, gemm_by_slice<float>)
QTB_KERNEL(dgemm, gemm, double, gemm_by_slice<double>)
QTB_KERNEL(cgemm, gemm, cfloat, gemm_by_slice<cfloat>)
QTB_KERNEL(zgemm, gemm, cdouble, gemm_by_slice<cdouble>)

}  // namespace qtb::QTB_TIER
