// sgemm, cgemm, zgemm of def and sse3: C := alpha*op(A)*op(B) + beta*C.
//
// C is m x n with columns ldc apart, op(A) m x k, op(B) k x n. A beta of 0 stores without reading C, an alpha of 0
// reads neither A nor B. A and B do not overlap C.
//
// The depth is cut into blocks of a fixed length, the remainder first. The first block
// applies beta, all others add: C is read and written once per block and never for beta alone.
#include "blas/kernels/level3/gemm/body.h"
#include "blas/kernels/level3/gemm/def/buffers.h"
#include "blas/kernels/level3/gemm/def/kernels.h"
#include "blas/kernels/level3/gemm/def/tile.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct FoldingKernels {
  InnerProcedure<T> *one, *one_fixed, *zero;
  void (*other)(QTB_BETA_KERNEL_PARAMS(T));
};
template <class T>
constexpr FoldingKernels<T> folding_kernels{};
#define QTB_FOLDING_KERNELS(T, t, fixed)                                                   \
  template <>                                                                              \
  constexpr FoldingKernels<T> folding_kernels<T> = {QTB_TIER_NAME(t##gemm_kernel),         \
                                                    QTB_TIER_NAME(t##gemm_kernel_##fixed), \
                                                    QTB_TIER_NAME(t##gemm_kernel_0), QTB_TIER_NAME(t##gemm_kernel_b)};
QTB_FOLDING_KERNELS(float, s, 112)
QTB_FOLDING_KERNELS(cfloat, c, 64)
QTB_FOLDING_KERNELS(cdouble, z, 64)

template <class T>
QTB_FUNCTION(gemm, T, gemm) {
  constexpr GemmRules rules = rules_of<T>;
  const Product<T> p = {transa, transb, *m, *n, *k, *alpha, a, *lda, b, *ldb, c, *ldc};
  const T first_beta = *beta;
  if (p.m < 1 || p.n < 1) return;
  if (is_zero(p.alpha)) {
    if (!is_one(first_beta)) scale_columns<T>(m, n, beta, c, ldc);
    return;
  }
  if (is_small(p, limits_of<T, Family::base, BodyForm::full>)) return small_path<T>(QTB_ARGS(gemm));

  const Op op_a = read_op<T>(transa), op_b = read_op<T>(transb);
  const bool a_is_n = op_a == Op::none, b_is_n = op_b == Op::none;
  PanelCopy<T> *const copy_a = copies_of<T, Family::base>.a[static_cast<int>(op_a)];
  PanelCopy<T> *const copy_b = copies_of<T, Family::base>.b[static_cast<int>(op_b)];
  const FoldingKernels<T> &kernels = folding_kernels<T>;
  const BetaLanes<T> beta_lanes(first_beta);
  GemmBlocks blocks{};
  fill_blocks(rules, p.m, p.n, p.k, nullptr, blocks);
  const QtbInt full_m = round_down(p.m, rules.mr), remainder = p.k % blocks.kb;
  const QtbInt stage_bytes = InnerKernel<T, Family::base>::stage_bytes(blocks.kb);
  const GemmBuffers<T> buffers = get_buffers_for<T>(blocks.mb, blocks.nb, blocks.kb, stage_bytes, slack_of_regions);
  if (buffers.allocation == nullptr) return small_path<T>(QTB_ARGS(gemm));

  for (QtbInt j0 = 0; j0 < p.n; j0 += blocks.nb) {
    const QtbInt columns = smaller(blocks.nb, p.n - j0);
    QtbInt depth = remainder == 0 ? blocks.kb : remainder;
    for (QtbInt l0 = 0; l0 < p.k; l0 += depth, depth = blocks.kb) {
      const QtbInt kp = round_up(depth, rules.ku), step_a = kp * rules.mr, step_b = kp * rules.nr;
      const T block_beta = l0 == 0 ? first_beta : one_of(first_beta);
      const Beta form = beta_of(block_beta);
      copy_b(&depth, &columns, b + (b_is_n ? l0 + j0 * p.ldb : j0 + l0 * p.ldb), ldb, buffers.b, &step_b, nullptr);
      for (QtbInt i0 = 0; i0 < full_m; i0 += blocks.mb) {
        const QtbInt rows = smaller(blocks.mb, full_m - i0);
        T *const tile = c + i0 + j0 * p.ldc;
        copy_a(&rows, &depth, a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda), lda, buffers.a, &step_a, alpha);
        if (form == Beta::other)
          kernels.other(rows, columns, kp, buffers.a, step_a, buffers.b, step_b, tile, p.ldc, buffers.stage,
                        beta_lanes.lane);
        else
          (form == Beta::zero ? kernels.zero
           : kp == blocks.kb
               ? kernels.one_fixed
               : kernels.one)(rows, columns, kp, buffers.a, step_a, buffers.b, step_b, tile, p.ldc, buffers.stage);
      }
      if (full_m < p.m) run_small(p, a_is_n, b_is_n, full_m, j0, columns, l0, depth, block_beta);
    }
  }
  free_buffers(buffers);
}

}  // namespace

QTB_KERNEL(sgemm, gemm, float, gemm<float>)
QTB_KERNEL(cgemm, gemm, cfloat, gemm<cfloat>)
QTB_KERNEL(zgemm, gemm, cdouble, gemm<cdouble>)

}  // namespace qtb::QTB_TIER
