// What parallel drivers call of the base families of the tiers from ssse3 on: block sizes, B packed outside, B in
// place.
#include "blas/kernels/level3/gemm/body.h"

namespace qtb::QTB_TIER {

QTB_KERNEL(dgemm_bpacked, gemm_bpacked, double, gemm_of_packed_b<double>)
QTB_KERNEL(cgemm_bpacked, gemm_bpacked, cfloat, gemm_of_packed_b<cfloat>)
QTB_KERNEL(zgemm_bpacked, gemm_bpacked, cdouble, gemm_of_packed_b<cdouble>)
QTB_KERNEL(sgemm_nobcopy, gemm, float, gemm_in_place<float>)

}  // namespace qtb::QTB_TIER
