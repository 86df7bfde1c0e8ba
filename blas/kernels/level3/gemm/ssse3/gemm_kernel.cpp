// The inner kernels of the ssse3 tier by name.
#include "blas/kernels/level3/gemm/ssse3/gemm_kernel.h"

namespace qtb::QTB_TIER {
namespace {

// Complex panels of this depth have straight-line code.
constexpr QtbInt fixed_depth = 128;

}  // namespace

// The base family: one procedure for any C, which looks at its alignment once, and the same with B in place.
#define REAL_KERNELS(name, T)                                                               \
  extern "C" void QTB_TIER_NAME(name##_kernel)(QTB_INNER_KERNEL_PARAMS(T)) {                \
    if (is_aligned(c, ldc))                                                                 \
      multiply_panels<T, Family::base, true>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);  \
    else                                                                                    \
      multiply_panels<T, Family::base, false>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage); \
  }                                                                                         \
  extern "C" void QTB_TIER_NAME(name##_kernel_nobcopy)(QTB_IN_PLACE_KERNEL_PARAMS(T)) {     \
    if (is_aligned(c, ldc))                                                                 \
      multiply_in_place<T, true>(transb, m, n, depth, ap, ldap, b, ldb, c, ldc, stage);     \
    else                                                                                    \
      multiply_in_place<T, false>(transb, m, n, depth, ap, ldap, b, ldb, c, ldc, stage);    \
  }
REAL_KERNELS(sgemm, float)
REAL_KERNELS(dgemm, double)

// C at any address: beside a whole depth of work, its few unaligned loads do not show.
#define COMPLEX_KERNELS(name, T)                                                                             \
  extern "C" void QTB_TIER_NAME(name##_kernel)(QTB_INNER_KERNEL_PARAMS(T)) {                                 \
    if (kp == fixed_depth)                                                                                   \
      multiply_panels<T, Family::base, false, fixed_depth / 2>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage); \
    else                                                                                                     \
      multiply_panels<T, Family::base, false>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);                  \
  }
COMPLEX_KERNELS(cgemm, cfloat)
COMPLEX_KERNELS(zgemm, cdouble)

// The SSE4.1 family: no instruction of it is above the tier's set; its design is that of the processors that have more.
#define SSE41_KERNELS(name, T)                                                             \
  extern "C" void QTB_TIER_NAME(name##_kernel_sse41_cu)(QTB_INNER_KERNEL_PARAMS(T)) {      \
    multiply_panels<T, Family::sse41, false>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage); \
  }                                                                                        \
  extern "C" void QTB_TIER_NAME(name##_kernel_sse41_ca)(QTB_INNER_KERNEL_PARAMS(T)) {      \
    multiply_panels<T, Family::sse41, true>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);  \
  }
SSE41_KERNELS(sgemm, float)
SSE41_KERNELS(dgemm, double)
SSE41_KERNELS(cgemm, cfloat)
SSE41_KERNELS(zgemm, cdouble)

}  // namespace qtb::QTB_TIER
