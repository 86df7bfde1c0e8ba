// The inner kernels of sse42 and of avx in the types that both have: each for any C and for an aligned one.
#include "blas/kernels/level3/gemm/sse42/gemm_kernel.h"

namespace qtb::QTB_TIER {

QTB_DIAGONAL_KERNELS(sgemm, float)
QTB_DIAGONAL_KERNELS(cgemm, cfloat)
QTB_DIAGONAL_KERNELS(zgemm, cdouble)

}  // namespace qtb::QTB_TIER
