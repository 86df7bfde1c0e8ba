// sgemm, dgemm, cgemm, zgemm of the ssse3 tier, and the pieces of its two families that parallel drivers call.
//
// Of the two, the one with the shuffles of later processors is taken where SSE4.1 is.
#include "blas/kernels/level3/gemm/body.h"
#include "service/cpu.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
QTB_FUNCTION(gemm, T, gemm) {
  if (qtb_serv_cpu_takes_sse41() != 0) return gemm_by_slice<T, Family::sse41>(QTB_ARGS(gemm));
  gemm_by_slice<T, Family::base>(QTB_ARGS(gemm));
}

}  // namespace

QTB_KERNEL(sgemm, gemm, float, gemm<float>)
QTB_KERNEL(dgemm, gemm, double, gemm<double>)
QTB_KERNEL(cgemm, gemm, cfloat, gemm<cfloat>)
QTB_KERNEL(zgemm, gemm, cdouble, gemm<cdouble>)
QTB_KERNEL(dgemm_nobcopy, gemm, double, gemm_in_place<double>)

QTB_KERNEL(sgemm_sse41, gemm, float, (gemm_in_place<float, Family::sse41>))
QTB_KERNEL(dgemm_sse41, gemm, double, (gemm_in_place<double, Family::sse41>))
QTB_KERNEL(cgemm_sse41, gemm_bpacked, cfloat, (gemm_of_packed_b<cfloat, Family::sse41>))
QTB_KERNEL(zgemm_sse41, gemm_bpacked, cdouble, (gemm_of_packed_b<cdouble, Family::sse41>))
QTB_KERNEL(sgemm_sse41_packed, gemm_packed, float, (gemm_of_packed<float, Family::sse41>))
QTB_KERNEL(dgemm_sse41_packed, gemm_packed, double, (gemm_of_packed<double, Family::sse41>))
QTB_KERNEL(cgemm_sse41_packed, gemm_packed, cfloat, (gemm_of_packed<cfloat, Family::sse41>))
QTB_KERNEL(zgemm_sse41_packed, gemm_packed, cdouble, (gemm_of_packed<cdouble, Family::sse41>))

}  // namespace qtb::QTB_TIER
