// sgemm, cgemm, zgemm of def and sse3.
//
// The depth is cut into blocks of a fixed length, the remainder first, and the kernels apply beta: C is read and
// written once per block and never for beta alone.
#include "blas/kernels/level3/gemm/body.h"
#include "blas/kernels/level3/gemm/def/kernels.h"
#include "blas/kernels/level3/gemm/def/tile.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct FoldingRecord {
  InnerProcedure<T> *one, *one_fixed, *zero;
  void (*other)(QTB_BETA_KERNEL_PARAMS(T));
};
template <class T>
constexpr FoldingRecord<T> folding_kernels{};
#define QTB_FOLDING_KERNELS(T, t, fixed)                                                  \
  template <>                                                                             \
  constexpr FoldingRecord<T> folding_kernels<T> = {QTB_TIER_NAME(t##gemm_kernel),         \
                                                   QTB_TIER_NAME(t##gemm_kernel_##fixed), \
                                                   QTB_TIER_NAME(t##gemm_kernel_0), QTB_TIER_NAME(t##gemm_kernel_b)};
QTB_FOLDING_KERNELS(float, s, 112)
QTB_FOLDING_KERNELS(cfloat, c, 64)
QTB_FOLDING_KERNELS(cdouble, z, 64)
#undef QTB_FOLDING_KERNELS

template <class T>
struct FoldingKernels {
  static constexpr QtbInt stage_per_k = inner_kernel<T, Family::base>.stage_per_k;
  static constexpr QtbInt whole_depth = rules_of<T>.kb.value;

  Beta form;
  BetaLanes<T> beta_lanes;
  FoldingKernels(const Product<T> &, T beta) : form(beta_of(beta)), beta_lanes(beta) {}

  void run(const Block<T> &x, bool first) const {
    constexpr FoldingRecord<T> kernels = folding_kernels<T>;
    const Beta beta = first ? form : Beta::one;
    if (beta == Beta::other)
      kernels.other(x.m, x.n, x.kp, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, x.stage, beta_lanes.lane);
    else
      (beta == Beta::zero    ? kernels.zero
       : x.kp == whole_depth ? kernels.one_fixed
                             : kernels.one)(x.m, x.n, x.kp, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, x.stage);
  }
};

template <class T>
QTB_FUNCTION(gemm, T, gemm) {
  const Product<T> p = product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc);
  if (begin_product<T, Family::base>(p, beta))
    add_blocks<T, Family::base, Source::packed, Source::packed, FoldingKernels<T>>(p, body_blocks<T, Family::base>(p),
                                                                                   beta);
}

}  // namespace

QTB_KERNEL(sgemm, gemm, float, gemm<float>)
QTB_KERNEL(cgemm, gemm, cfloat, gemm<cfloat>)
QTB_KERNEL(zgemm, gemm, cdouble, gemm<cdouble>)

}  // namespace qtb::QTB_TIER
