// dgemm of sse3: C := alpha*op(A)*op(B) + beta*C.
//
// C is m x n with columns ldc apart, op(A) m x k, op(B) k x n. A beta of 0 stores without reading C, an alpha of 0
// reads neither A nor B. A and B do not overlap C.
//
// The first block of the depth applies beta, all others add; the kernels take any number of rows and columns. A small
// product of an A whose rows lie side by side packs nothing: its kernels read A and B where they are.
#include "blas/kernels/level3/gemm/body.h"
#include "blas/kernels/level3/gemm/def/buffers.h"
#include "blas/kernels/level3/gemm/def/kernels.h"
#include "blas/kernels/level3/gemm/def/tile.h"

namespace qtb::QTB_TIER {
namespace {

using EdgeKernel = void(QTB_EDGE_KERNEL_PARAMS);

// m + n + k from which A is copied in any case.
constexpr QtbInt copied_size = 385;
constexpr QtbInt fixed_depth = 112;
// Of the stage of one micro-panel, which these kernels do without, the buffer keeps the room.
constexpr QtbInt stage_bytes_per_k = 64;
constexpr QtbInt slack = 18176;

EdgeKernel *packed_kernel(QtbInt m, QtbInt n, QtbInt kp, Beta beta) {
  if (beta == Beta::zero) return qtb_blas_sse3_dgemm_kernel_ak_0;
  if (beta == Beta::other) return qtb_blas_sse3_dgemm_kernel_ak_b;
  if (kp != fixed_depth) return qtb_blas_sse3_dgemm_kernel_ak;
  return m % 4 == 0 && n % 4 == 0 ? qtb_blas_sse3_dgemm_kernel_a112 : qtb_blas_sse3_dgemm_kernel_a112e;
}

EdgeKernel *in_place_kernel(bool b_is_n, QtbInt depth, Beta beta) {
  if (beta == Beta::zero) return b_is_n ? qtb_blas_sse3_dgemm_kernel_nk_0 : qtb_blas_sse3_dgemm_kernel_tk_0;
  if (beta == Beta::other) return b_is_n ? qtb_blas_sse3_dgemm_kernel_nk_b : qtb_blas_sse3_dgemm_kernel_tk_b;
  if (depth != fixed_depth) return b_is_n ? qtb_blas_sse3_dgemm_kernel_nk : qtb_blas_sse3_dgemm_kernel_tk;
  return b_is_n ? qtb_blas_sse3_dgemm_kernel_n112 : qtb_blas_sse3_dgemm_kernel_t112;
}

// A is not transposed, and no dimension exceeds a block but the depth.
void run_in_place(const Product<double> &p, bool b_is_n, QtbInt kb, double first_beta) {
  const BetaLanes<double> alpha_lanes(p.alpha), beta_lanes(first_beta);
  for (QtbInt l0 = 0; l0 < p.k; l0 += kb) {
    const QtbInt depth = smaller(kb, p.k - l0);
    in_place_kernel(b_is_n, depth, l0 == 0 ? beta_of(first_beta) : Beta::one)(
        p.m, p.n, depth, p.a + l0 * p.lda, p.lda, p.b + (b_is_n ? l0 : l0 * p.ldb), p.ldb, p.c, p.ldc, alpha_lanes.lane,
        beta_lanes.lane);
  }
}

void run_packed(const Product<double> &p, bool a_is_n, bool b_is_n, const GemmBlocks &blocks, double first_beta) {
  PanelCopy<double> *const copy_a = copies_of<double, Family::base>.a[a_is_n ? 0 : 1];
  PanelCopy<double> *const copy_b = copies_of<double, Family::base>.b[b_is_n ? 0 : 1];
  const BetaLanes<double> beta_lanes(first_beta);
  const GemmBuffers<double> buffers =
      get_buffers_for<double>(blocks.mb, blocks.nb, blocks.kb, stage_bytes_per_k * blocks.kb, slack);
  if (buffers.allocation == nullptr) return run_small(p, a_is_n, b_is_n, 0, 0, p.n, 0, p.k, first_beta);
  for (QtbInt j0 = 0; j0 < p.n; j0 += blocks.nb) {
    const QtbInt columns = smaller(blocks.nb, p.n - j0);
    for (QtbInt l0 = 0; l0 < p.k; l0 += blocks.kb) {
      const QtbInt depth = smaller(blocks.kb, p.k - l0), kp = round_up(depth, blocks.ku);
      const QtbInt step_a = kp * blocks.mr, step_b = kp * blocks.nr;
      const Beta form = l0 == 0 ? beta_of(first_beta) : Beta::one;
      copy_b(&depth, &columns, p.b + (b_is_n ? l0 + j0 * p.ldb : j0 + l0 * p.ldb), &p.ldb, buffers.b, &step_b, nullptr);
      for (QtbInt i0 = 0; i0 < p.m; i0 += blocks.mb) {
        const QtbInt rows = smaller(blocks.mb, p.m - i0);
        copy_a(&rows, &depth, p.a + (a_is_n ? i0 + l0 * p.lda : l0 + i0 * p.lda), &p.lda, buffers.a, &step_a, &p.alpha);
        packed_kernel(rows, columns, kp, form)(rows, columns, kp, buffers.a, step_a, buffers.b, step_b,
                                               p.c + i0 + j0 * p.ldc, p.ldc, nullptr, beta_lanes.lane);
      }
    }
  }
  free_buffers(buffers);
}

QTB_FUNCTION(gemm, double, gemm) {
  const Product<double> p = {transa, transb, *m, *n, *k, *alpha, a, *lda, b, *ldb, c, *ldc};
  const double first_beta = *beta;
  if (p.m < 1 || p.n < 1) return;
  if (is_zero(p.alpha)) {
    if (!is_one(first_beta)) scale_columns<double>(m, n, beta, c, ldc);
    return;
  }
  if (is_small(p, limits_of<double, Family::base, BodyForm::full>)) return small_path<double>(QTB_ARGS(gemm));
  const bool a_is_n = read_op<double>(transa) == Op::none, b_is_n = read_op<double>(transb) == Op::none;
  GemmBlocks blocks{};
  fill_blocks(rules_of<double>, p.m, p.n, p.k, nullptr, blocks);
  if (a_is_n && p.m + p.n + p.k < copied_size)
    run_in_place(p, b_is_n, blocks.kb, first_beta);
  else
    run_packed(p, a_is_n, b_is_n, blocks, first_beta);
}

}  // namespace

QTB_KERNEL(dgemm, gemm, double, gemm)

}  // namespace qtb::QTB_TIER
