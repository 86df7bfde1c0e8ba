// The inner kernels of sse42 in double precision: for any C and for an aligned one.
#include "blas/kernels/level3/gemm/sse42/gemm_kernel.h"

namespace qtb::QTB_TIER {

QTB_DIAGONAL_KERNELS(dgemm, double)

}  // namespace qtb::QTB_TIER
