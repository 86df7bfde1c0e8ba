// The inner kernels of sse42, and of avx but for double precision: each for any C and for an aligned one.
#include "blas/kernels/level3/gemm/sse42/gemm_kernel.h"

namespace qtb::QTB_TIER {

#define DIAGONAL_KERNELS(name, T)                                               \
  extern "C" void QTB_TIER_NAME(name##_kernel_cu)(QTB_INNER_KERNEL_PARAMS(T)) { \
    diagonal_kernel<T, false>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);     \
  }                                                                             \
  extern "C" void QTB_TIER_NAME(name##_kernel_ca)(QTB_INNER_KERNEL_PARAMS(T)) { \
    diagonal_kernel<T, true>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);      \
  }

DIAGONAL_KERNELS(sgemm, float)
#if QTB_TIER_IS(sse42)
DIAGONAL_KERNELS(dgemm, double)
#endif
DIAGONAL_KERNELS(cgemm, cfloat)
DIAGONAL_KERNELS(zgemm, cdouble)

}  // namespace qtb::QTB_TIER
