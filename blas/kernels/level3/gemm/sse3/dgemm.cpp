// dgemm of sse3.
//
// Its kernels apply beta and take any number of rows and columns. A small product of an A whose rows lie side by side
// packs nothing: its kernels read A and B where they are.
#include "blas/kernels/level3/gemm/body.h"
#include "blas/kernels/level3/gemm/def/kernels.h"
#include "blas/kernels/level3/gemm/def/tile.h"

namespace qtb::QTB_TIER {
namespace {

using EdgeKernel = void(QTB_EDGE_KERNEL_PARAMS);

// m + n + k from which A is copied in any case.
constexpr QtbInt copied_size = 385;

template <bool packed>
struct EdgeKernels {
  // Of the stage of one micro-panel, which these kernels do without, the buffer keeps the room.
  static constexpr QtbInt stage_per_k = 64, whole_depth = 112;

  bool b_is_n;
  Beta form;
  BetaLanes<double> alpha_lanes, beta_lanes;
  EdgeKernels(const Product<double> &p, double beta)
      : b_is_n(read_op<double>(p.transb) == Op::none), form(beta_of(beta)), alpha_lanes(p.alpha), beta_lanes(beta) {}

  void run(const Block<double> &x, bool first) const {
    const QtbInt depth = packed ? x.kp : x.depth;
    kernel(x, depth, first ? form : Beta::one)(x.m, x.n, depth, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, alpha_lanes.lane,
                                               beta_lanes.lane);
  }
  EdgeKernel *kernel(const Block<double> &x, QtbInt depth, Beta beta) const {
    if constexpr (packed) {
      if (beta == Beta::zero) return qtb_blas_sse3_dgemm_kernel_ak_0;
      if (beta == Beta::other) return qtb_blas_sse3_dgemm_kernel_ak_b;
      if (depth != whole_depth) return qtb_blas_sse3_dgemm_kernel_ak;
      return x.m % 4 == 0 && x.n % 4 == 0 ? qtb_blas_sse3_dgemm_kernel_a112 : qtb_blas_sse3_dgemm_kernel_a112e;
    }
    if (beta == Beta::zero) return b_is_n ? qtb_blas_sse3_dgemm_kernel_nk_0 : qtb_blas_sse3_dgemm_kernel_tk_0;
    if (beta == Beta::other) return b_is_n ? qtb_blas_sse3_dgemm_kernel_nk_b : qtb_blas_sse3_dgemm_kernel_tk_b;
    if (depth != whole_depth) return b_is_n ? qtb_blas_sse3_dgemm_kernel_nk : qtb_blas_sse3_dgemm_kernel_tk;
    return b_is_n ? qtb_blas_sse3_dgemm_kernel_n112 : qtb_blas_sse3_dgemm_kernel_t112;
  }
};

QTB_FUNCTION(gemm, double, gemm) {
  const Product<double> p = product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc);
  if (!begin_product<double, Family::base>(p, beta)) return;
  const GemmBlocks blocks = body_blocks<double, Family::base>(p);
  if (read_op<double>(transa) == Op::none && p.m + p.n + p.k < copied_size)
    add_blocks<double, Family::base, Source::in_place, Source::in_place, EdgeKernels<false>>(p, blocks, beta);
  else
    add_blocks<double, Family::base, Source::packed, Source::packed, EdgeKernels<true>>(p, blocks, beta);
}

}  // namespace

QTB_KERNEL(dgemm, gemm, double, gemm)

}  // namespace qtb::QTB_TIER
