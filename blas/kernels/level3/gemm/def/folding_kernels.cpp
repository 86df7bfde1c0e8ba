// sgemm_kernel, cgemm_kernel, zgemm_kernel of def and sse3: C := beta*C + Ap*Bp (kernels.h beside this file).
#include "blas/kernels/level3/gemm/def/staged.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
constexpr int block_depth_of = static_cast<int>(rules_of<T>.kb.value);
template <class T>
constexpr StagedForm fixed_depth{Steps::all, block_depth_of<T>};
template <class T>
constexpr StagedForm general_depth{Steps::fours, 0};

}  // namespace

#define QTB_KERNEL_FORM(name, T, beta, form)                                               \
  extern "C" void QTB_TIER_NAME(name)(QTB_INNER_KERNEL_PARAMS(T)) {                        \
    run_on_panels<T, beta, form<T>>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage, nullptr); \
  }
#define QTB_FOLDING_KERNELS(T, t, fixed)                                                                      \
  QTB_KERNEL_FORM(t##gemm_kernel, T, Beta::one, general_depth)                                                \
  QTB_KERNEL_FORM(t##gemm_kernel_##fixed, T, Beta::one, fixed_depth)                                          \
  QTB_KERNEL_FORM(t##gemm_kernel_0, T, Beta::zero, general_depth)                                             \
  extern "C" void QTB_TIER_NAME(t##gemm_kernel_b)(QTB_BETA_KERNEL_PARAMS(T)) {                                \
    run_on_panels<T, Beta::other, general_depth<T>>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage, beta_lanes); \
  }
QTB_FOLDING_KERNELS(float, s, 112)
QTB_FOLDING_KERNELS(cfloat, c, 64)
QTB_FOLDING_KERNELS(cdouble, z, 64)

}  // namespace qtb::QTB_TIER
